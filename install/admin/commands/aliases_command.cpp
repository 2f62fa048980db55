#include <CLI/CLI.hpp>
#include <array>
#include <map>
#include <optional>

#include "install/admin/commands/commands.h"
#include "install/admin/formats/text_table.h"
#include "install/platform/text.h"
#include "install/src/copies/alias_rewrite.h"
#include "install/src/registry/copy_layout.h"

namespace kz7 {
namespace {

struct AliasRow {
    std::string prefix;                               // as stored, or as a rewrite would write it
    std::array<std::optional<std::string>, 2> names;  // the copy that the alias names in each view
    std::array<bool, 2> deletable = {};               // in each view: the rewrite's walk reaches it
    std::optional<std::string> should;                // none: the next rewrite deletes it where its walk reaches it
    std::string version;                              // of the copy it should name
    bool exact = false;
};

// Compares as the registry does and orders as the rewrite does.
struct ByPrefix {
    bool operator()(const std::string& left, const std::string& right) const {
        return foldUpper(left) < foldUpper(right);
    }
};
using AliasRows = std::map<std::string, AliasRow, ByPrefix>;

AliasRow& rowOf(AliasRows& rows, std::string_view prefix) {
    AliasRow& row = rows[std::string(prefix)];
    row.prefix = row.prefix.empty() ? prefix : row.prefix;
    return row;
}

// The values of one view, also those that the rewrite's walk does not reach. kFileNotFound: no copies' key exists.
Status readValues(IRegistryStore& registry, std::string_view path, std::size_t view, AliasRows& rows) {
    OwnedKey key(registry);
    Status status = registry.openKey(KeyHandle::localMachine, path, kKeyRead, key.receive());
    TextBuffer<kMaxValueName + 1> name;
    std::string room(1 << 12, '\0');
    bool walked = true;
    for (std::uint32_t index = 0; succeeded(status); ++index) {
        Buffer data(room.data(), static_cast<std::uint32_t>(room.size()));
        status = registry.enumerateValue(key.get(), index, name, nullptr, nullptr);
        if (succeeded(status)) {
            status = registry.queryValue(key.get(), name.view(), nullptr, data);
        }
        if (status == kMoreData && data.size > data.capacity) {
            room.resize(data.size);
            data = Buffer(room.data(), data.size);
            status = registry.queryValue(key.get(), name.view(), nullptr, data);
        }
        if (!succeeded(status)) {
            break;
        }
        walked = walked && fitsCharacters(name.text(), kAliasNameRoom - 1);
        AliasRow& row = rowOf(rows, name.text());
        row.names[view] = data.text();
        row.deletable[view] = walked;
    }
    return isEndOfItems(status) ? kSuccess : status;
}

// The aliases that a rewrite would write; none if the copies' key is missing.
void computeAliases(Admin& admin, AliasRows& rows) {
    InstallCopiesProfile profile(admin.registry(), admin.platform().debugOutput(), kKeyRead);
    if (profile.generateInstallCopiesList() != kSuccess || profile.generateProfileInfo() != kSuccess) {
        return;
    }
    for (const auto& [prefix, name] : profile.profileInfo()) {
        AliasRow& row = rowOf(rows, prefix);
        row.should = name;
        row.exact = isWholeVersion(prefix);
        const auto copy = profile.copiesByName().find(name);
        row.version = copy == profile.copiesByName().end() ? std::string{} : copy->second.getVersion();
    }
}

// What a rewrite does to an alias without a copy.
std::string fateOf(const AliasRow& row, std::string_view missingView) {
    if (!missingView.empty()) {
        return "leaves it: the copies' key is missing from the " + std::string(missingView) + " view";
    }
    const auto stays = [&](std::size_t view) { return row.names[view] && !row.deletable[view]; };
    if (!stays(0) && !stays(1)) {
        return "deletes it";
    }
    const std::string fate = row.deletable[0]   ? "deletes it from the native view only"
                             : row.deletable[1] ? "deletes it from the 32-bit view only"
                                                : "leaves it";
    return fate + ": a value name of 100 characters or more ends its walk";
}

std::string why(const AliasRow& row, std::string_view missingView) {
    if (!row.should) {
        return "no copy has such a version; the next rewrite " + fateOf(row, missingView);
    }
    if (row.version.empty()) {
        return row.exact ? "no copy has exactly this version; written empty" : "no version continues it; written empty";
    }
    return shownText(row.version) + (row.exact ? " is this version" : " is the highest that begins with it");
}

bool isAskedFor(std::string_view prefix, std::string_view asked) {
    return asked.empty() || equalsIgnoreCase(prefix, asked) ||
           (prefix.size() > asked.size() && prefix[asked.size()] == '.' &&
            equalsIgnoreCase(prefix.substr(0, asked.size()), asked));
}

std::string shownName(const std::optional<std::string>& name) {
    return !name ? "-" : name->empty() ? "(empty)" : shownText(*name);
}

std::string aliasesText(const AliasRows& rows, const std::string& asked, std::string_view missingView,
                        std::uint32_t columns) {
    std::vector<TableRow> table = {{"PREFIX", "NATIVE", "32-BIT", "SHOULD BE", "WHY"}};
    for (const auto& [key, row] : rows) {
        if ((row.should || isAliasName(row.prefix)) && isAskedFor(row.prefix, asked)) {
            table.push_back({row.prefix.empty() ? "(default)" : shownText(row.prefix), shownName(row.names[0]),
                             shownName(row.names[1]), shownName(row.should), why(row, missingView)});
        }
    }
    return table.size() == 1 ? std::string{} : tableText(table, columns);
}

Answer showAliases(Admin& admin, const std::string& asked) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    AliasRows rows;
    std::string_view missingView;  // a rewrite then fails before it changes anything
    for (const auto& [path, view] : {std::pair{layout::kCopies, 0U}, {layout::kCopies32, 1U}}) {
        const Status status = readValues(admin.registry(), path, view, rows);
        if (isNotFound(status)) {
            missingView = view == 0 ? "native" : "32-bit";
        } else if (!succeeded(status)) {
            return admin.storeFault("cannot read aliases", status);
        }
    }
    computeAliases(admin, rows);
    if (admin.platform().storeFaultTold()) {
        return kAnswerFault;
    }
    const std::string text = aliasesText(rows, asked, missingView, admin.output().columns);
    return text.empty() ? admin.no("no such alias: " + shownText(asked.empty() ? admin.platform().storeName() : asked))
                        : admin.show(text);
}

}  // namespace

void addAliasesCommand(CLI::App& program, Admin& admin) {
    auto* command = program.add_subcommand("aliases", "Show the copy of each version prefix");
    auto prefix = std::make_shared<std::string>();
    command->add_option("PREFIX", *prefix, "Only this prefix and longer ones, such as 9.7 for 9");
    command->callback([&admin, prefix] { admin.answer = [&admin, prefix] { return showAliases(admin, *prefix); }; });
}

}  // namespace kz7
