#include <algorithm>

#include "install/admin/change_report.h"
#include "install/admin/commands/commands.h"
#include "install/admin/run_history.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

struct UndoOptions : ChangeOptions {
    std::uint64_t number = 0;
};

Answer refuse(Admin& admin, const HistoryRun& run) {
    const std::string name = "run " + std::to_string(run.number);
    if (run.state == RunState::running) {
        return admin.no(name + " is in progress");
    }
    return run.isForeign ? admin.no(name + " was recorded on another machine: " + shownText(run.host)) : kAnswerYes;
}

// What cannot be taken back, and the runs that this one started.
Answer addNotes(Admin& admin, const HistoryRun& run, ChangeRun& shown) {
    for (const std::string& outside : run.outside) {
        shown.notes.push_back("not taken back: " + shownText(outside));
    }
    std::vector<HistoryRun> runs;
    const Answer listed = listRuns(admin, runs);
    for (const HistoryRun& other : runs) {
        if (other.parent == run.number) {
            shown.notes.push_back("not taken back: run " + std::to_string(other.number) + ", " + commandOf(other));
        }
    }
    return listed;
}

// What changed the rows of a run since it ended.
std::string since(Admin& admin, std::uint64_t number) {
    std::vector<HistoryRun> runs;
    listRuns(admin, runs);
    const auto later =
        std::find_if(runs.rbegin(), runs.rend(), [number](const HistoryRun& run) { return run.undoes == number; });
    return later == runs.rend() ? "its rows were changed since"
                                : "run " + std::to_string(later->number) + " took it back";
}

Answer takeBack(Admin& admin, const UndoOptions& options, const ChangeSet& changes) {
    const bool isOwn = admin.platform().storeIsOwn();
    admin.beginRun(false, options.number);
    RecordedPorts recorded(admin.platform().ports(), {.wholeServices = isOwn, .holdsCommits = true, .everyKey = true});
    if (const Answer made = makeChanges(admin, recorded.ports(), changes); made != kAnswerYes) {
        return made;
    }
    const Status status = recorded.commit();
    return status == kSuccess ? kAnswerYes
                              : admin.storeFault("cannot take back run " + std::to_string(options.number), status);
}

Answer undo(Admin& admin, const UndoOptions& options) {
    if (!admin.openExisting(options.check)) {
        return kAnswerFault;
    }
    HistoryRun run;
    ChangeRun shown;
    Answer answer = findRun(admin, options.number, run);
    answer = answer == kAnswerYes ? refuse(admin, run) : answer;
    answer = answer == kAnswerYes ? readInverse(admin, run, shown.changes) : answer;
    answer = answer == kAnswerYes ? addNotes(admin, run, shown) : answer;
    if (answer != kAnswerYes) {
        return answer;
    }
    std::vector<const Change*> conflicts;
    std::string key;
    const Status status = findConflicts(admin.registry(), admin.platform().storeIsOwn(), shown.changes, conflicts, key);
    if (status != kSuccess) {
        return admin.storeFault("cannot read: " + shownText(key), status);
    }
    if (!conflicts.empty()) {
        for (const Change* const change : conflicts) {
            shown.conflicts.push_back(*change);
        }
        shown.changes.clear();
        shown.notes.clear();
        admin.tell("cannot take back run " + std::to_string(run.number) + ": " + since(admin, run.number));
        return showRun(admin, options, shown);
    }
    shown.counts = countChanges(shown.changes);
    if (!options.check) {
        answer = takeBack(admin, options, shown.changes);
    }
    return answer == kAnswerYes ? showRun(admin, options, shown) : answer;
}

}  // namespace

void addUndoCommand(Command& program, Admin& admin) {
    auto command = program.add("undo", "Take a run back, or do again what an undo took back");
    auto& options = command.answerWith(admin, undo);
    addChangeOptions(command, admin, options);
    command.number("N", options.number, "The number of the run in the history").isRequired();
}

}  // namespace kz7
