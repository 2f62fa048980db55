#include <algorithm>

#include "install/admin/change_report.h"
#include "install/admin/commands/commands.h"
#include "install/admin/repair.h"

namespace kz7 {
namespace {

struct RepairOptions : ChangeOptions {
    std::vector<std::string> words;
    RepairRequest request;
};

// Sorts the words into kinds and the name of a copy; the last word may be one. A fault is returned as text.
std::string readWords(const std::vector<std::string>& words, RepairRequest& request) {
    for (const std::string& word : words) {
        for (const FindingKind& kind : findingKinds()) {
            if (!kind.group.empty() && kind.group == word) {
                request.groups.insert(kind.group);
            } else if (!kind.group.empty() && kind.name == word) {
                request.kinds.insert(kind.name);
            }
        }
        if (!isRepairWord(word) && (&word != &words.back() || word.empty() || !request.copy.empty())) {
            return "not a kind of finding: " + shownText(word);
        }
        request.copy = isRepairWord(word) ? request.copy : word;
    }
    return {};
}

Status copySavedProperties(Admin& admin, Preview& preview, std::string& key) {
    MachineState machine;
    const Status status = readMachine(admin.registry(), Depth::whole, machine, key);
    std::vector<KeyChange> keys;
    for (const std::string& path : machine.savedProperties) {
        keys.push_back({.name = {KeyHandle::users, path}, .keyClass = {}, .remove = true, .values = {}});
    }
    return status == kSuccess ? preview.fill(keys, key) : status;
}

// The name of a copy that nothing belongs to is a mistake, and so may be a kind that a copy is called.
Answer checkName(Admin& admin, const RepairOptions& options) {
    const RepairRequest& request = options.request;
    MachineState machine;
    std::string key;
    if (const Status status = readMachine(admin.registry(), Depth::whole, machine, key); status != kSuccess) {
        return admin.storeFault("cannot read: " + shownText(key), status);
    }
    if (request.copy.empty() && options.words.size() > 1 && machine.find(options.words.back()) != nullptr) {
        return admin.fault(shownText(options.words.back()) + ": both a kind of finding and a copy (see --copy)");
    }
    const bool hasService = std::any_of(machine.services.begin(), machine.services.end(), [&](const ServiceRow& row) {
        return equalsIgnoreCase(row.copy, request.copy);
    });
    return request.copy.empty() || hasService || machine.find(request.copy) != nullptr
               ? kAnswerYes
               : admin.fault("neither a kind of finding nor a copy: " + shownText(request.copy) +
                             " (see kz7admin check)");
}

Answer repairOn(Admin& admin, const RepairOptions& options, const Ports& ports, ChangeRun& run) {
    std::vector<Finding> rest;
    std::string key;
    run.status = repairMachine(ports, admin.platform().storeIsOwn(), options.request, rest, key);
    if (admin.platform().storeFaultTold()) {
        return kAnswerFault;
    }
    if (run.status != kSuccess) {
        return admin.storeFault("cannot repair: " + shownText(key), run.status);
    }
    for (const Finding& finding : rest) {
        const std::string line = findingLine(finding);
        run.notes.push_back("not repaired: " + line.substr(0, line.size() - 1));
        run.status = kFailed;
    }
    return kAnswerYes;
}

Answer preview(Admin& admin, const RepairOptions& options) {
    Preview preview(admin.platform(), true);
    if (const Answer filled = fillPreview(admin, preview); filled != kAnswerYes) {
        return filled;
    }
    std::string key;
    if (const Status status = copySavedProperties(admin, preview, key); status != kSuccess) {
        return admin.storeFault("cannot read: " + shownText(key), status);
    }
    ChangeRun run;
    const Answer answer = repairOn(admin, options, preview.ports(), run);
    run.set(preview.changes());
    return answer == kAnswerYes ? showRun(admin, options, run) : answer;
}

Answer repair(Admin& admin, RepairOptions options) {
    if (!admin.openExisting(options.check)) {
        return kAnswerFault;
    }
    if (const std::string fault = readWords(options.words, options.request); !fault.empty()) {
        return admin.fault(fault + " (see kz7admin repair --help)");
    }
    if (const Answer answer = checkName(admin, options); answer != kAnswerYes) {
        return answer;
    }
    if (options.check) {
        return preview(admin, options);
    }
    admin.beginRun();
    RecordedPorts recorded(admin.platform().ports(),
                           {.wholeServices = admin.platform().storeIsOwn(), .holdsCommits = true});
    ChangeRun run;
    Answer answer = repairOn(admin, options, recorded.ports(), run);
    answer = answer == kAnswerYes ? commitRun(admin, options, recorded, "repair", run) : answer;
    return answer == kAnswerYes ? showRun(admin, options, run) : answer;
}

}  // namespace

void addRepairCommand(Command& program, Admin& admin) {
    auto command = program.add("repair", "Repair what check reports");
    auto& options = command.answerWith(admin, repair);
    command.describe(
        "A KIND is the first word of a line of check, or a group of kinds: aliases,\n"
        "copies, services, properties, migration. Without one, all but services and\n"
        "migration is repaired. No program is started.");
    addChangeOptions(command, admin, options);
    command.texts("KIND", options.words, "What to repair; the last word may name a copy");
    command.text("--copy", options.request.copy, "Only what belongs to this copy, whatever it is called");
    auto on = command.text("--on", options.request.location, "Finish a half-done migration to this location");
    on.isFileName();
    command.flag("--back", options.request.isBack, "Take a half-done migration back").excludes(on);
}

}  // namespace kz7
