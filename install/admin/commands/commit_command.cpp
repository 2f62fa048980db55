#include <algorithm>

#include "install/admin/change_report.h"
#include "install/admin/commands/commands.h"
#include "install/admin/configuration_run.h"
#include "install/admin/copy_location.h"
#include "install/admin/input_file.h"
#include "install/platform/host_information.h"
#include "install/platform/text.h"
#include "install/runtime/config_handler.h"
#include "install/runtime/observers/log_observer.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/copy_name.h"

namespace kz7 {
namespace {

struct Words : ChangeOptions {
    std::string copy;
    std::string instance;
    std::string responseFile;
    std::string logFile;
    bool machine = false;
};

Answer readResponses(Admin& admin, const Words& words, ConfigurationRequest& request) {
    InputFile file(admin, words.responseFile);
    if (const Answer answer = file.read(); answer != kAnswerYes) {
        return answer;
    }
    ResponseFault bad;
    const Status status = parseResponseFile(file.bytes(), request.responses, bad);
    return status == kSuccess ? kAnswerYes : file.badLine(bad.line, bad.reason);
}

Answer findCopy(Admin& admin, const Words& words, ConfigurationRequest& request) {
    const std::string shown = shownText(words.copy);
    const std::string path = substituteCopyName(layout::kCopy, words.copy);
    OwnedKey key(admin.registry());
    const Status status = words.copy.empty() || !isOneName(words.copy)
                              ? kFileNotFound
                              : admin.registry().openKey(KeyHandle::localMachine, path, kKeyRead, key.receive());
    if (isNotFound(status)) {
        return admin.fault("no such copy: " + shown + " (see kz7admin copies)");
    }
    if (status != kSuccess) {
        return admin.storeFault("cannot read copy: " + shown, status);
    }
    request.copy = words.copy;
    request.location = locationOf(admin.registry(), path);
    return request.location.empty() ? admin.fault("copy has no location: " + shown) : kAnswerYes;
}

// Fails before anything is set if the log cannot be opened.
Answer findLog(Admin& admin, const Words& words, ConfigurationRequest& request) {
    if (words.check) {
        return kAnswerYes;
    }
    IFileSystem& files = admin.platform().files();
    Status status = kSuccess;
    if (words.logFile.empty()) {
        status = admin.platform().ownFolder(request.logFile);
        request.logFile.append("\\").append(kLogFileName);
    } else if (const Answer found = admin.findFile("log", words.logFile, request.logFile); found != kAnswerYes) {
        return found;
    }
    if (status == kSuccess && !fitsCharacters(request.logFile, kPathSize - 1)) {
        status = kFilenameExceedsRange;
    }
    OwnedFile log(files);
    if (status == kSuccess) {
        status = files.openForAppend(request.logFile, log.receive());
    }
    const std::string shown = words.logFile.empty() ? files.shownPath(request.logFile) : words.logFile;
    return status == kSuccess ? kAnswerYes
                              : admin.fault(compose("cannot write log: %s: %s", {shownText(shown), reasonOf(status)}));
}

// A relative path begins at the current directory, as that of a response file does.
Answer findMessages(Admin& admin, const Words&, ConfigurationRequest& request) {
    const std::string path = environmentText(kMessagesVariable);
    if (path.empty()) {
        return kAnswerYes;
    }
    const Status status = admin.platform().files().productPath(path, request.messageFile);
    return status == kSuccess
               ? kAnswerYes
               : admin.fault(compose("%s: %s: %s", {kMessagesVariable, shownText(path), reasonOf(status)}));
}

Answer preview(Admin& admin, const Words& words, ConfigurationRequest request) {
    Preview preview(admin.platform(), false);
    if (const Answer filled = fillPreview(admin, preview); filled != kAnswerYes) {
        return filled;
    }
    ChangeRun run;
    run.status = runConfiguration(preview.ports(), std::move(request)).notSet == 0 ? kSuccess : kParameterNotSet;
    return showPreview(admin, words, preview, run);
}

Answer run(Admin& admin, const Words& words, ConfigurationRequest request) {
    const std::string log = admin.platform().files().shownPath(request.logFile);
    admin.beginRun(true);
    MemoryConsole kept;
    Ports ports = admin.platform().ports();
    ports.console = admin.isJson ? &kept : ports.console;
    RecordedPorts recorded(ports, {.wholeServices = admin.platform().storeIsOwn()});
    const ConfigurationOutcome outcome = runConfiguration(recorded.ports(), std::move(request));
    if (outcome.kept != kSuccess) {
        return admin.storeFault("cannot save changes: " + shownText(words.copy), outcome.kept);
    }
    if (words.machine) {
        return outcome.notSet == 0 ? kAnswerYes : kAnswerNo;
    }
    ChangeRun run;
    run.status = outcome.notSet == 0 ? kSuccess : kParameterNotSet;
    takeChanges(admin, words, recorded, run);
    run.output = kept.output;
    takeErrorLines(kept.error, run);
    run.heading = compose("%s: %u set, %u not set; the log is %s\n",
                          {shownText(words.copy), outcome.set, outcome.notSet, shownText(log)});
    // Text that cannot be written is reported and does not change the exit status: the values are set.
    const Answer shown = showRun(admin, words, run);
    return shown != kAnswerFault ? shown : outcome.notSet == 0 ? kAnswerYes : kAnswerNo;
}

Answer commit(Admin& admin, const Words& words) {
    if (!fitsCharacters(words.instance, kMaxInstanceName) || !isOneName(words.instance)) {
        return admin.open(true) ? admin.fault(compose("invalid instance name: %s: at most %u characters, no separators",
                                                      {shownText(words.instance), std::uint32_t{kMaxInstanceName}}))
                                : kAnswerFault;
    }
    if (!admin.openExisting(words.check)) {
        return kAnswerFault;
    }
    ConfigurationRequest request;
    request.instance = words.instance;
    request.machine = words.machine;
    for (const auto step : {readResponses, findCopy, findLog, findMessages}) {
        if (const Answer answer = step(admin, words, request); answer != kAnswerYes) {
            return answer;
        }
    }
    return words.check ? preview(admin, words, std::move(request)) : run(admin, words, std::move(request));
}

}  // namespace

void addCommitCommand(Command& program, Admin& admin) {
    auto command = program.add("commit", "Set what a response file says for a copy");
    auto& words = command.answerWith(admin, commit);
    command.text("--copy", words.copy, "The copy's name").isRequired();
    command.text("--response-file", words.responseFile, "Lines NAME = value; \"-\" is standard input")
        .isRequired()
        .isFileName();
    command.text("--instance", words.instance, "The instance; the whole copy without it");
    command.text("--log", words.logFile, "The log; kz7msi.log in the state directory without it");
    auto machine = command.flag("--machine", words.machine, "Speak the progress protocol, for a front end");
    addChangeOptions(command, admin, words, &machine);
}

}  // namespace kz7
