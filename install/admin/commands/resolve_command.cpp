#include <algorithm>

#include "install/admin/commands/commands.h"
#include "install/admin/findings.h"
#include "install/admin/formats/text_table.h"
#include "install/admin/open_machine.h"

namespace kz7 {
namespace {

struct ResolveOptions {
    std::string prefix;
    std::string view = "native";
    std::string field;
};

// What a view answers for a prefix.
struct Resolved {
    const CopyInView* copy = nullptr;  // null: no alias names an installed copy
    std::string named;                 // the alias's data
    std::string fault;                 // why it must not be relied on; empty: it is right
    std::vector<const CopyRow*> candidates;
};

bool hasAliases(const MachineState& machine, std::size_t view) {
    return std::any_of(machine.aliases.begin(), machine.aliases.end(),
                       [&](const auto& row) { return row.second.values[view] && isAliasName(row.second.prefix); });
}

Resolved resolve(const MachineState& machine, const std::string& prefix, std::size_t view) {
    Resolved resolved;
    resolved.candidates = candidatesOf(machine, prefix);
    const auto found = machine.aliases.find(foldUpper(prefix));
    const std::string alias = compose("alias %s (%s view): ", {shownText(prefix), kViews[view].name});
    if (found == machine.aliases.end() || !found->second.values[view]) {
        const bool isRewritten = hasAliases(machine, view) || resolved.candidates.empty();
        resolved.fault = alias + (isRewritten ? "does not exist" : "the aliases were never written: see -dotnet");
        return resolved;
    }
    resolved.named = found->second.values[view]->text;
    const CopyRow* const named = machine.find(resolved.named);
    if (named != nullptr && named->views[view]) {
        resolved.copy = &*named->views[view];
    }
    if (const auto finding = judgeAlias(machine, found->second, view, true)) {
        resolved.fault = alias + finding->why() + "; repair: kz7admin repair aliases";
    } else if (resolved.copy == nullptr) {
        resolved.fault =
            alias + (resolved.named.empty() ? "names no copy" : shownText(resolved.named) + " is not in that view");
    }
    return resolved;
}

std::string resolvedText(const Resolved& resolved, const std::string& prefix, std::size_t view, std::uint32_t columns) {
    std::vector<TableRow> table = {{"", "NAME", "VERSION", "LOCATION", "WHY"}};
    for (const CopyRow* const candidate : resolved.candidates) {
        const CopyInView& copy = candidate->views[view] ? *candidate->views[view] : candidate->shown();
        const bool isNamed = equalsIgnoreCase(copy.name, resolved.named);
        table.push_back(
            {isNamed ? "*" : "", shownText(copy.name), shownText(copy.info.getVersion()), shownText(copy.location),
             candidate == resolved.candidates.front() ? "the highest that begins with " + shownText(prefix) : "lower"});
    }
    if (resolved.copy != nullptr && isWholeVersion(prefix) && table.size() > 1) {
        table[1].back() = "is this version";
    }
    return table.size() == 1 ? std::string{} : tableText(table, columns);
}

std::string fieldOf(const CopyInView& copy, const std::string& field) {
    return field == "name" ? copy.name : field == "version" ? copy.info.getVersion() : copy.location;
}

void appendCopy(const CopyInView& copy, JsonWriter& json) {
    json.field("name", copy.name).field("version", copy.info.getVersion()).field("location", copy.location);
}

Answer showJson(Admin& admin, const Resolved& resolved, const ResolveOptions& options, std::size_t view) {
    JsonWriter json = beginDocument();
    json.field("prefix", options.prefix).field("view", options.view);
    json.field("names", resolved.named).field("right", resolved.fault.empty()).field("why", resolved.fault);
    if (resolved.copy != nullptr) {
        appendCopy(*resolved.copy, json);
    }
    json.field("candidates").beginArray();
    for (const CopyRow* const candidate : resolved.candidates) {
        json.beginObject();
        appendCopy(candidate->views[view] ? *candidate->views[view] : candidate->shown(), json);
        json.end();
    }
    return admin.writeJson(json.end());
}

Answer showResolved(Admin& admin, const ResolveOptions& options) {
    MachineState machine;
    if (const Answer read = openMachine(admin, Depth::copies, machine); read != kAnswerYes) {
        return read;
    }
    const std::size_t view = options.view == kViews[kOther].name ? kOther : kNative;
    const Resolved resolved = resolve(machine, options.prefix, view);
    Answer written = kAnswerYes;
    if (admin.isJson) {
        written = showJson(admin, resolved, options, view);
    } else if (options.field.empty()) {
        written = admin.write(resolvedText(resolved, options.prefix, view, admin.output().columns));
    } else if (resolved.copy != nullptr) {
        const std::string text = fieldOf(*resolved.copy, options.field);
        written = admin.write((admin.output().terminal ? shownText(text) : text) + '\n', Admin::Form::document);
    }
    return written != kAnswerYes || resolved.fault.empty() ? written : admin.no(resolved.fault);
}

}  // namespace

void addResolveCommand(Command& program, Admin& admin) {
    auto command = program.add("resolve", "Show the copy that a version prefix names");
    auto& options = command.answerWith(admin, showResolved);
    command.describe("Exits with 1 if the prefix names no copy or one that it should not name.");
    command.text("PREFIX", options.prefix, "A version or the beginning of one: 9, 9.7").isRequired();
    command.text("--view", options.view, "The view to ask: native or 32-bit").isOneOf({"native", "32-bit"});
    auto field = command.text("--field", options.field, "Only this: name, location or version")
                     .isOneOf({"name", "location", "version"});
    command.json(admin).excludes(field);
}

}  // namespace kz7
