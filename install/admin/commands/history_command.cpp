#include <algorithm>
#include <charconv>
#include <chrono>

#include "install/admin/commands/commands.h"
#include "install/admin/formats/change_text.h"
#include "install/admin/formats/reg_text.h"
#include "install/admin/formats/text_table.h"
#include "install/admin/run_history.h"
#include "install/platform/text.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/copy_name.h"
#include "install/src/services/management_service.h"

namespace kz7 {
namespace {

struct HistoryOptions {
    std::string copy;
    std::uint64_t number = 0;
    std::uint64_t keep = 0;
    std::string before;  // a date; empty: `keep` counts
    bool check = false;
    bool diff = false;
    bool reg = false;
};

// Whether a run changed a key of the copy or its service.
bool concerns(const ChangeSet& changes, const std::string& copy) {
    std::vector<std::string> trees = {std::string(kServiceKeys) + std::string(managementServiceName(copy).view())};
    for (const std::string_view root : {layout::kCopy, layout::kCopy32}) {
        trees.push_back(substituteCopyName(root, copy));
    }
    return std::any_of(changes.begin(), changes.end(), [&](const Change& change) {
        return std::any_of(trees.begin(), trees.end(), [&](const std::string& tree) {
            const std::string key = fullKeyName({KeyHandle::localMachine, tree}) + '\\';
            return equalsIgnoreCase((change.key + '\\').substr(0, key.size()), key);
        });
    });
}

Answer selectRuns(Admin& admin, const std::string& copy, std::vector<HistoryRun>& runs) {
    Answer answer = listRuns(admin, runs);
    std::reverse(runs.begin(), runs.end());
    if (!copy.empty()) {
        std::erase_if(runs, [&](const HistoryRun& run) {
            ChangeSet changes;
            answer = answer == kAnswerYes ? readRun(admin, run, changes) : answer;
            return !concerns(changes, copy);
        });
    }
    return answer;
}

std::string runsText(const std::vector<HistoryRun>& runs, std::uint32_t columns) {
    std::vector<TableRow> table = {{"RUN", "TIME", "USER", "COMMAND", "STATUS", "ROWS"}};
    for (const HistoryRun& run : runs) {
        table.push_back({std::to_string(run.number), utcTime(run.begun), shownText(run.user), commandOf(run),
                         stateOf(run), std::to_string(run.counts.values + run.counts.keys + run.counts.services)});
    }
    return tableText(table, columns);
}

Answer showJson(Admin& admin, const std::vector<HistoryRun>& runs) {
    JsonWriter json = beginDocument();
    json.field("runs").beginArray();
    for (const HistoryRun& run : runs) {
        appendRun(run, json.beginObject());
        json.end();
    }
    return admin.writeJson(json.end());
}

Answer showHistory(Admin& admin, const HistoryOptions& options) {
    std::vector<HistoryRun> runs;
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    if (const Answer selected = selectRuns(admin, options.copy, runs); selected != kAnswerYes) {
        return selected;
    }
    if (admin.isJson) {
        return showJson(admin, runs);
    }
    return runs.empty() ? admin.no("no run is recorded: " + shownText(admin.platform().storeName()))
                        : admin.show(runsText(runs, admin.output().columns));
}

std::string runText(const HistoryRun& run, const ChangeSet& changes, bool withChanges, bool isColoured) {
    std::string text = "run " + std::to_string(run.number) + ": " + commandOf(run) + '\n';
    text += "begun " + utcTime(run.begun) + (run.ended == 0 ? "" : ", ended " + utcTime(run.ended)) + ", by " +
            shownText(run.user) + " on " + shownText(run.host) + ", status " + stateOf(run) + '\n';
    if (run.parent != 0) {
        text += "started by run " + std::to_string(run.parent) + '\n';
    }
    text += withChanges ? changeText(changes, isColoured) : std::string{};
    for (const std::string& outside : run.outside) {
        text += markedLine('!', shownText(outside), isColoured);
    }
    return text + changeSummary(countChanges(changes)) + '\n';
}

Answer showOne(Admin& admin, const HistoryOptions& options) {
    HistoryRun run;
    ChangeSet changes;
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    Answer answer = findRun(admin, options.number, run);
    answer = answer == kAnswerYes ? readRun(admin, run, changes) : answer;
    if (answer != kAnswerYes) {
        return answer;
    }
    if (options.reg) {
        return admin.write(regTextHeader() + changeRegText(changes), Admin::Form::document);
    }
    if (!admin.isJson) {
        return admin.write(runText(run, changes, options.diff, admin.output().colours));
    }
    JsonWriter json = beginDocument();
    appendRun(run, json);
    appendChanges(changes, json.field("changes"));
    return admin.writeJson(json);
}

// The number of the first run that stays.
std::uint64_t firstLeft(const std::vector<HistoryRun>& runs, const HistoryOptions& options) {
    const auto first = std::find_if(runs.begin(), runs.end(), [&](const HistoryRun& run) {
        const auto left = static_cast<std::uint64_t>(&runs.back() - &run) + 1;
        const bool isKept = options.before.empty() ? left <= options.keep : utcTime(run.begun) >= options.before;
        return isKept || run.state == RunState::running;  // it will add to its entry
    });
    return first == runs.end() ? runs.back().number + 1 : first->number;
}

Answer showTrimmed(Admin& admin, const HistoryOptions& options, std::uint32_t removed) {
    if (admin.isJson) {
        JsonWriter json = beginDocument();
        json.field("check", options.check).field("changed", removed != 0);
        return admin.writeJson(json.field("removed", removed));
    }
    return admin.write(removed == 0 ? "unchanged\n"
                                    : compose("%s: %u run%s\n", {options.check ? "would remove" : "removed", removed,
                                                                 removed == 1 ? "" : "s"}));
}

Answer trim(Admin& admin, const HistoryOptions& options) {
    std::vector<HistoryRun> runs;
    if (!admin.openExisting(options.check)) {
        return kAnswerFault;
    }
    if (const Answer listed = listRuns(admin, runs); listed != kAnswerYes) {
        return listed;
    }
    const std::uint64_t first = runs.empty() ? 0 : firstLeft(runs, options);
    const auto removed = static_cast<std::uint32_t>(
        std::count_if(runs.begin(), runs.end(), [first](const HistoryRun& run) { return run.number < first; }));
    Status status = kSuccess;
    if (removed != 0 && !options.check) {
        status = admin.platform().history()->trim(first);
        const Status committed = admin.registry().commit();
        status = status == kSuccess ? committed : status;
    }
    return status == kSuccess ? showTrimmed(admin, options, removed)
                              : admin.storeFault("cannot trim the history", status);
}

Answer turn(Admin& admin, bool on) {
    if (!admin.open(false)) {
        return kAnswerFault;
    }
    IHistory* const history = admin.platform().history();
    const bool wasOn = history->isOn();
    const Status status = history->turn(on);
    if (status == kCallNotImplemented && !on) {
        return admin.no("the history is part of the store and always on");
    }
    if (status != kSuccess && status != kCallNotImplemented) {
        return admin.storeFault(
            on ? "cannot start the history in %ProgramData%\\KZ7\\history, which only administrators may own"
               : "cannot stop the history",
            status);
    }
    if (admin.isJson) {
        JsonWriter json = beginDocument();
        return admin.writeJson(json.field("changed", wasOn != on).field("on", on));
    }
    return admin.write(status == kCallNotImplemented ? "the history is always on\n"
                       : on                          ? "the history is on\n"
                                                     : "the history is off\n");
}

std::string dateFault(const std::string& text) {
    constexpr std::string_view kForm = "dddd-dd-ddTdd:dd:ddZ";
    bool fits = text.size() == 10 || text.size() == kForm.size();
    for (std::size_t at = 0; fits && at < text.size(); ++at) {
        fits = kForm[at] == 'd' ? text[at] >= '0' && text[at] <= '9' : text[at] == kForm[at];
    }
    const auto part = [&](std::size_t at, std::size_t size) {
        int number = 0;
        std::from_chars(text.data() + at, text.data() + at + size, number);
        return number;
    };
    using namespace std::chrono;
    fits = fits && year_month_day(year(part(0, 4)), month(static_cast<unsigned>(part(5, 2))),
                                  day(static_cast<unsigned>(part(8, 2))))
                       .ok();
    fits = fits && (text.size() == 10 || (part(11, 2) < 24 && part(14, 2) < 60 && part(17, 2) < 60));
    return fits ? "" : "not a date of the form 2026-01-31 or 2026-01-31T12:00:00Z";
}

void addShow(Command& history, Admin& admin, HistoryOptions& options) {
    auto show = history.add("show", "Show one run");
    show.answerWith(admin, showOne, options);
    show.number("N", options.number, "Its number").isRequired();
    auto diff = show.flag("--diff", options.diff, "Show each change");
    show.flag("--reg", options.reg, "Write its changes as registry-editor text").excludes(diff);
    show.json(admin).excludes(diff);
}

void addTrim(Command& history, Admin& admin, HistoryOptions& options) {
    auto trimmed = history.add("trim", "Remove the oldest runs from the history");
    trimmed.answerWith(admin, trim, options);
    auto keep = trimmed.number("--keep", options.keep, "Keep that many runs");
    auto before = trimmed.text("--before", options.before, "Keep the runs since a date (UTC)");
    before.check(dateFault).excludes(keep);
    trimmed.needsOneOf(keep, before);
    trimmed.flag("--check", options.check, "Change nothing; tell what would be removed");
    trimmed.json(admin);
}

}  // namespace

void addHistoryCommand(Command& program, Admin& admin) {
    auto command = program.add("history", "Show the recorded runs, and what each changed");
    auto& options = command.answerWith(admin, showHistory);
    command.text("NAME", options.copy, "Only the runs that changed this copy");
    command.json(admin);
    addShow(command, admin, options);
    addTrim(command, admin, options);
    auto start = command.add("start", "Record runs from now on (Windows)");
    start.answerWith(admin, [&admin] { return turn(admin, true); });
    start.json(admin);
    auto stop = command.add("stop", "Record no more runs (Windows)");
    stop.answerWith(admin, [&admin] { return turn(admin, false); });
    stop.json(admin);
}

}  // namespace kz7
