#include "install/admin/commands/commands.h"
#include "install/admin/copy_table.h"
#include "install/admin/open_machine.h"

namespace kz7 {
namespace {

// What a rewrite does to an alias without a copy.
std::string fateOf(const AliasRow& row, std::string_view missingView) {
    if (!missingView.empty()) {
        return "leaves it: the copies' key is missing from the " + std::string(missingView) + " view";
    }
    const auto stays = [&](std::size_t view) { return row.values[view] && !row.values[view]->isReachable; };
    const auto goes = [&](std::size_t view) { return row.values[view] && row.values[view]->isReachable; };
    if (!stays(kNative) && !stays(kOther)) {
        return "deletes it";
    }
    const std::string fate = goes(kNative)  ? "deletes it from the native view only"
                             : goes(kOther) ? "deletes it from the 32-bit view only"
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

std::string shownName(const std::optional<std::string>& name) {
    return !name ? "-" : name->empty() ? "(empty)" : shownText(*name);
}

std::optional<std::string> nameIn(const AliasRow& row, std::size_t view) {
    return row.values[view] ? std::optional(row.values[view]->text) : std::nullopt;
}

// A rewrite fails before it changes anything if a view is missing.
std::string_view missingViewOf(const MachineState& machine) {
    return !machine.hasView[kOther] ? "32-bit" : !machine.hasView[kNative] ? "native" : "";
}

std::string aliasesText(const std::vector<const AliasRow*>& rows, std::string_view missingView, std::uint32_t columns) {
    std::vector<TableRow> table = {{"PREFIX", "NATIVE", "32-BIT", "SHOULD BE", "WHY"}};
    for (const AliasRow* const row : rows) {
        table.push_back({row->prefix.empty() ? "(default)" : shownText(row->prefix), shownName(nameIn(*row, kNative)),
                         shownName(nameIn(*row, kOther)), shownName(row->should), why(*row, missingView)});
    }
    return tableText(table, columns);
}

struct AliasesOptions {
    std::string prefix;
};

Answer showAliases(Admin& admin, const AliasesOptions& options) {
    MachineState machine;
    if (const Answer read = openMachine(admin, Depth::copies, machine); read != kAnswerYes) {
        return read;
    }
    const std::vector<const AliasRow*> rows = aliasRows(machine, options.prefix);
    const std::string store = admin.platform().storeName();
    const std::string_view missingView = missingViewOf(machine);
    Answer shown = kAnswerYes;
    if (admin.isJson) {
        JsonWriter json = beginDocument();
        appendAliases(rows, json.field("store", store).field("aliases"));
        shown = admin.writeJson(json);
    } else if (!rows.empty()) {
        shown = admin.show(aliasesText(rows, missingView, admin.output().columns));
    }
    return shown != kAnswerYes || !rows.empty()
               ? shown
               : admin.no("no such alias: " + shownText(options.prefix.empty() ? store : options.prefix));
}

}  // namespace

void addAliasesCommand(Command& program, Admin& admin) {
    auto command = program.add("aliases", "Show the copy of each version prefix");
    auto& options = command.answerWith(admin, showAliases);
    command.text("PREFIX", options.prefix, "Only this prefix and longer ones, such as 9.7 for 9");
    command.json(admin);
}

}  // namespace kz7
