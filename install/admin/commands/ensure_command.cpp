#include "install/admin/change_report.h"
#include "install/admin/commands/commands.h"
#include "install/admin/ensurer.h"
#include "install/admin/input_file.h"

namespace kz7 {
namespace {

struct EnsureOptions : ChangeOptions, EnsureChoices {
    std::string file;
};

// Runs on recorded ports whose commits do nothing.
Answer ensureOn(Admin& admin, const EnsureOptions& options, const std::vector<WantedCopy>& wanted, const Ports& ports,
                ChangeRun& run) {
    Ensurer ensurer(ports, admin.platform().storeIsOwn(), options);
    if (const std::string refusal = ensurer.plan(wanted); !refusal.empty()) {
        return admin.fault(refusal);
    }
    run.status = ensurer.make(wanted);
    run.errors = std::move(ensurer.errors);
    run.notes = std::move(ensurer.notes);
    ports.registry->commit();
    if (!admin.isJson) {
        for (const ErrorLine& error : run.errors) {
            admin.tell(shownText(error.text.substr(0, error.text.find_last_not_of('\n') + 1)));
        }
    }
    return admin.platform().storeFaultTold() ? kAnswerFault : kAnswerYes;
}

Answer ensure(Admin& admin, const EnsureOptions& options) {
    if (!admin.open(options.check, true)) {
        return kAnswerFault;
    }
    InputFile file(admin, options.file);
    std::vector<WantedCopy> wanted;
    std::string fault;
    if (const Answer answer = file.read(); answer != kAnswerYes) {
        return answer;
    }
    if (!parseWantedCopies(file.bytes(), wanted, fault)) {
        return admin.fault(file.shown() + ": " + shownText(fault));
    }
    ChangeRun run;
    if (options.check) {
        Preview preview(admin.platform(), false);
        if (const Answer filled = fillPreview(admin, preview); filled != kAnswerYes) {
            return filled;
        }
        const Answer answer = ensureOn(admin, options, wanted, preview.ports(), run);
        run.set(preview.changes());
        return answer == kAnswerYes ? showRun(admin, options, run) : answer;
    }
    admin.beginRun();
    SilentConsole lines;
    Ports ports = admin.platform().ports();
    ports.console = &lines;
    const bool isOwn = admin.platform().storeIsOwn();
    RecordedPorts recorded(ports, {.wholeServices = isOwn, .holdsCommits = true});
    if (const Answer answer = ensureOn(admin, options, wanted, recorded.ports(), run); answer != kAnswerYes) {
        return answer;
    }
    if (!isOwn || run.status == kSuccess) {
        if (const Answer answer = commitRun(admin, options, recorded, file.shown(), run); answer != kAnswerYes) {
            return answer;
        }
    }
    return showRun(admin, options, run);
}

}  // namespace

void addEnsureCommand(Command& program, Admin& admin) {
    auto command = program.add("ensure", "Make the copies as a file lists them");
    auto& options = command.answerWith(admin, ensure);
    addChangeOptions(command, admin, options);
    command.text("--from", options.file, "A JSON file with the copies; \"-\" is standard input").isRequired();
    auto prune = command.flag("--prune", options.prune, "Remove the copies that the file does not list");
    command.flag("--all", options.all, "Remove the last copy and the product too").needs(prune);
    command.flag("--services", options.services, "Correct services that belong to another location");
}

}  // namespace kz7
