#include "install/admin/change_report.h"
#include "install/admin/commands/commands.h"
#include "install/admin/formats/reg_text.h"
#include "install/admin/input_file.h"
#include "install/admin/preview.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

struct ImportOptions : ChangeOptions {
    std::string file;
};

Answer importOn(Admin& admin, const InputFile& file, const std::vector<KeyChange>& changes, IRegistryStore& registry) {
    std::uint32_t line = 0;
    Status status = applyChanges(registry, changes, line);
    if (status != kSuccess) {
        return admin.storeFault(compose("cannot apply: %s:%u", {file.shown(), line}), status);
    }
    status = registry.commit();
    return status == kSuccess ? kAnswerYes : admin.storeFault("cannot save changes: " + file.shown(), status);
}

Answer preview(Admin& admin, const ImportOptions& options, const InputFile& file,
               const std::vector<KeyChange>& changes) {
    Preview preview(admin.platform(), false);
    std::string key;
    if (const Status status = preview.fill(changes, key); status != kSuccess) {
        return admin.storeFault("cannot read: " + shownText(key), status);
    }
    if (const Answer answer = importOn(admin, file, changes, *preview.ports().registry); answer != kAnswerYes) {
        return answer;
    }
    ChangeRun run;
    run.set(preview.changes());
    return showRun(admin, options, run);
}

Answer importFile(Admin& admin, const ImportOptions& options) {
    if (!admin.open(options.check, true)) {
        return kAnswerFault;
    }
    InputFile file(admin, options.file);
    if (const Answer answer = file.read(); answer != kAnswerYes) {
        return answer;
    }
    std::vector<KeyChange> changes;
    TextFault bad;
    if (!parseRegText(file.bytes(), changes, bad)) {
        return file.badLine(bad.line, bad.reason);
    }
    if (options.check) {
        return preview(admin, options, file, changes);
    }
    admin.beginRun();
    RecordedPorts recorded(admin.platform().ports(),
                           {.wholeServices = admin.platform().storeIsOwn(), .everyKey = true});
    if (const Answer answer = importOn(admin, file, changes, *recorded.ports().registry); answer != kAnswerYes) {
        return answer;
    }
    ChangeRun run;
    takeChanges(admin, options, recorded, run);
    std::size_t values = 0;
    for (const KeyChange& change : changes) {
        values += change.values.size();
    }
    run.heading = compose("imported %s into %s: %u keys, %u values\n",
                          {file.shown(), admin.storeLine(), static_cast<std::uint32_t>(changes.size()),
                           static_cast<std::uint32_t>(values)});
    return showRun(admin, options, run);
}

}  // namespace

void addImportCommand(Command& program, Admin& admin) {
    auto command = program.add("import", "Do what a file of registry-editor text asks for");
    auto& options = command.answerWith(admin, importFile);
    addChangeOptions(command, admin, options);
    command.text("FILE", options.file, "The file; \"-\" is standard input").isRequired();
}

}  // namespace kz7
