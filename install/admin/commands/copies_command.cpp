#include "install/admin/commands/commands.h"
#include "install/admin/copy_table.h"
#include "install/admin/open_machine.h"

namespace kz7 {
namespace {

struct CopiesOptions {
    CopyFilter filter;
    std::string versions;
    std::vector<std::string> columns;
    std::string format = "table";
};

// One line for each copy: an object, or texts between tabs.
std::string copiesLines(const std::vector<CopyLine>& lines, const CopiesOptions& options) {
    const std::vector<std::string> all(kCopyColumns.begin(), kCopyColumns.end());
    std::string text;
    for (const CopyLine& line : lines) {
        if (options.format == "jsonl") {
            JsonWriter json;
            appendCopy(line, options.columns, json);
            text += json.take();
            continue;
        }
        std::string_view separator;
        for (const std::string& column : options.columns.empty() ? all : options.columns) {
            text.append(separator).append(shownText(copyField(line, column)));
            separator = "\t";
        }
        text += '\n';
    }
    return text;
}

Answer show(Admin& admin, const std::vector<CopyLine>& lines, const CopiesOptions& options, const std::string& store) {
    if (options.format == "table") {
        return admin.show(copiesText(lines, options.columns, admin.output().columns));
    }
    if (options.format == "json") {
        JsonWriter json = beginDocument();
        appendCopies(lines, options.columns, json.field("store", store).field("copies"));
        return admin.writeJson(json);
    }
    return admin.show(copiesLines(lines, options), Admin::Form::document);
}

Answer showCopies(Admin& admin, CopiesOptions options) {
    options.format = admin.isJson ? "json" : options.format;
    admin.isJson = options.format.starts_with("json");
    if (VersionRange range; !options.versions.empty()) {
        if (!range.parse(options.versions)) {
            return admin.open(true) ? admin.fault("not a range of versions: " + shownText(options.versions) +
                                                  " (write [9.7,9.8) or 9.7)")
                                    : kAnswerFault;
        }
        options.filter.versions = range;
    }
    MachineState machine;
    if (const Answer read = openMachine(admin, Depth::copies, machine); read != kAnswerYes) {
        return read;
    }
    const std::vector<CopyLine> lines = copyLines(machine, admin.platform().services(), options.filter, admin.isJson);
    if (admin.platform().storeFaultTold()) {
        return kAnswerFault;
    }
    const std::string store = admin.platform().storeName();
    const Answer shown = show(admin, lines, options, store);
    if (shown != kAnswerYes || !lines.empty()) {
        return shown;
    }
    return admin.no((machine.copies.empty() ? "no installed copy: " : "no such copy: ") + shownText(store));
}

}  // namespace

void addCopiesCommand(Command& program, Admin& admin) {
    auto command = program.add("copies", "Show the installed copies and their services");
    auto& options = command.answerWith(admin, showCopies);
    command.describe(
        "\"*\" marks the default copy. VIEW is \"both\" if 64-bit and 32-bit programs see the\n"
        "same, and \"removed\" if only the key is left that a removal leaves behind.");
    command.text("NAME", options.filter.name, "Only this copy");
    command.text("--version", options.versions, "Only a range such as [9.7,9.8), compared as texts");
    command.text("--view", options.filter.view, "Only this view: native or 32-bit").isOneOf({"native", "32-bit"});
    command.flag("--valid", options.filter.valid, "Only copies with a valid version");
    command.flag("--default", options.filter.isDefault, "Only the default copy");
    command.texts("--columns", options.columns, "What is shown, in order, separated by commas")
        .isSplitAt(',')
        .isOneOf({kCopyColumns.begin(), kCopyColumns.end()});
    auto format = command.text("--format", options.format, "table, tsv, json or jsonl")
                      .isOneOf({"table", "tsv", "json", "jsonl"});
    command.json(admin).excludes(format);
}

}  // namespace kz7
