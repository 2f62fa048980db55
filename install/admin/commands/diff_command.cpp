#include "install/admin/commands/commands.h"
#include "install/admin/formats/change_text.h"
#include "install/admin/formats/reg_text.h"
#include "install/admin/registry_source.h"

namespace kz7 {
namespace {

struct DiffOptions {
    std::string before;
    std::string after;
    std::string key;
    bool reg = false;
    bool stat = false;
};

Answer readBoth(Admin& admin, const DiffOptions& options, Snapshot& old, Snapshot& now) {
    RegistrySource before(admin, options.before);
    RegistrySource after(admin, options.after);
    for (RegistrySource* const source : {&before, &after}) {
        if (const Answer opened = source->open(); opened != kAnswerYes) {
            return opened;
        }
    }
    const bool wholeServices = before.isOwn() && after.isOwn();
    // Of a machine's registry only the product's keys can be compared with something.
    const bool isProduct = options.key.empty() && !wholeServices;
    for (const auto& [source, snapshot] : {std::pair(&before, &old), {&after, &now}}) {
        const Answer read = isProduct ? source->readProduct(wholeServices, *snapshot)
                                      : source->read(options.key, wholeServices, *snapshot);
        if (read != kAnswerYes) {
            return read;
        }
    }
    return options.key.empty() || !old.empty() || !now.empty()
               ? kAnswerYes
               : admin.fault("no such key: " + shownText(fullKeyName(typedKeyName(options.key))));
}

Answer diff(Admin& admin, const DiffOptions& options) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    Snapshot old;
    Snapshot now;
    if (const Answer read = readBoth(admin, options, old, now); read != kAnswerYes) {
        return read;
    }
    const ChangeSet changes = difference(old, now);
    Answer written = kAnswerYes;
    if (admin.isJson) {
        JsonWriter json = beginDocument();
        appendChanges(changes, json.field("changed", !changes.empty()).field("changes"));
        written = admin.writeJson(json);
    } else if (options.reg) {
        written = admin.write(regTextHeader() + changeRegText(changes), Admin::Form::document);
    } else {
        written = admin.write(options.stat ? changeSummary(countChanges(changes), "differ") + '\n'
                                           : changeText(changes, admin.output().colours));
    }
    return written != kAnswerYes || changes.empty() ? written : kAnswerNo;
}

}  // namespace

void addDiffCommand(Command& program, Admin& admin) {
    auto command = program.add("diff", "Show what differs between two registries");
    auto& options = command.answerWith(admin, diff);
    command.describe(
        "A and B are each a state directory, a backup, a file of registry-editor text,\n"
        "\".\" for this machine, or \"@N\" for this machine before run N of its history.\n"
        "\n"
        "Exit codes: 0 they are the same; 1 they differ; 2 one cannot be read.\n");
    command.text("A", options.before, "The registry before").isRequired();
    command.text("B", options.after, "The registry after").isRequired();
    command.text("KEY", options.key, "The key to compare; without it everything");
    auto reg = command.flag("--reg", options.reg, "Write the file whose import turns A into B");
    auto json = command.json(admin).excludes(reg);
    command.flag("--stat", options.stat, "Count the differences").excludes(reg).excludes(json);
}

}  // namespace kz7
