#include "install/admin/change_report.h"
#include "install/admin/commands/commands.h"
#include "install/admin/copy_location.h"
#include "install/platform/text.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/services/management_service.h"
#include "install/src/uselvlkz7reg.h"

namespace kz7 {
namespace {

struct ApplyOptions : ChangeOptions {
    std::vector<std::string> words;
    bool noLevel = false;
};

// A copy that gets another location keeps the service that it has.
void noteServices(IRegistryStore& registry, const ChangeSet& changes, ChangeRun& run) {
    const std::string copies = "HKEY_LOCAL_MACHINE\\" + std::string(layout::kCopies) + '\\';
    for (const Change& change : changes) {
        if (change.isKey() || !change.after || change.name != layout::kPathName ||
            !equalsIgnoreCase(std::string_view(change.key).substr(0, copies.size()), copies)) {
            continue;
        }
        const std::string service(managementServiceName(change.key.substr(copies.size())).view());
        ValueState program;
        if (readServiceProgram(registry, service, program) == kSuccess && !program.data.empty() &&
            !isProgramOf(change.after->text(), program.text())) {
            run.notes.push_back("service " + shownText(service) + " stays at " + shownText(program.text()));
        }
    }
}

// The tool does not write a line on standard error for every status.
void tellStatus(Admin& admin, const ApplyOptions& options, const ChangeRun& run) {
    if (run.status != kSuccess && run.errors.empty()) {
        admin.tell(compose("kz7InstallReg %s with %u", {options.check ? "would exit" : "exited", run.status}));
    }
}

Answer preview(Admin& admin, const ApplyOptions& options, std::span<const char* const> arguments) {
    Preview preview(admin.platform(), !options.noLevel);
    if (const Answer filled = fillPreview(admin, preview); filled != kAnswerYes) {
        return filled;
    }
    ChangeRun run;
    run.status = runTool(preview.ports(), arguments, &run.errors);
    noteServices(*preview.ports().registry, preview.changes(), run);
    tellStatus(admin, options, run);
    return showPreview(admin, options, preview, run);
}

// Knows whether the last line that passed was ended.
class LineConsole final : public IConsole {
public:
    explicit LineConsole(IConsole& real) : real_(real) {}

    Status writeOutput(std::string_view text) override {
        isOpen_ = text.empty() ? isOpen_ : !text.ends_with('\n');
        return real_.writeOutput(text);
    }
    Status writeError(std::string_view text) override { return real_.writeError(text); }
    Status flush() override { return real_.flush(); }

    void endLine() {
        if (isOpen_) {
            writeOutput("\n");
        }
    }

private:
    IConsole& real_;
    bool isOpen_ = false;
};

Answer run(Admin& admin, const ApplyOptions& options, std::span<const char* const> arguments) {
    admin.beginRun(startsPrograms(arguments));
    MemoryConsole kept;
    LineConsole shown(admin.platform().console());
    Ports ports = admin.platform().ports();
    ports.console = admin.isJson ? static_cast<IConsole*>(&kept) : &shown;
    RecordedPorts recorded(ports, {.wholeServices = admin.platform().storeIsOwn()});
    ChangeRun run;
    run.status = runTool(recorded.ports(), arguments, &run.errors);
    takeChanges(admin, options, recorded, run);
    run.output = kept.output;
    shown.endLine();
    noteServices(admin.registry(), recorded.changes(), run);
    admin.registry().commit();  // the end of the transaction of the notes
    tellStatus(admin, options, run);
    const Answer answer = showRun(admin, options, run);
    return admin.platform().storeFaultTold() ? kAnswerFault : answer;
}

std::string shownWords(const std::vector<std::string>& words) {
    std::string text;
    for (const std::string& word : words) {
        text += (text.empty() ? "" : " ") + shownText(word);
    }
    return text;
}

Answer apply(Admin& admin, const ApplyOptions& options) {
    std::vector<const char*> arguments = {"kz7InstallReg"};
    for (const std::string& word : options.words) {
        arguments.push_back(word.c_str());
    }
    if (!isToolCommand(arguments)) {
        return admin.open(true) ? admin.fault("not a command of kz7InstallReg: " + shownWords(options.words) +
                                              " (see kz7admin apply --help)")
                                : kAnswerFault;
    }
    if (!admin.open(options.check, true)) {
        return kAnswerFault;
    }
    return options.check ? preview(admin, options, arguments) : run(admin, options, arguments);
}

}  // namespace

void addApplyCommand(Command& program, Admin& admin) {
    auto command = program.add("apply", "Run a kz7InstallReg command, or show what it would do");
    auto& options = command.answerWith(admin, apply);
    addChangeOptions(command, admin, options);
    command.flag("--no-level", options.noLevel, "With --check, load no level library");
    command.texts("COMMAND", options.words, "An option of kz7InstallReg and its arguments, after \"--\"").isRequired();
}

}  // namespace kz7
