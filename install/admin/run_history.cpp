#include "install/admin/run_history.h"

#include <algorithm>
#include <chrono>

#include "install/platform/text.h"
#include "install/src/registry/touched_rows.h"

namespace kz7 {
namespace {

std::string runName(std::uint64_t number) {
    return "run " + std::to_string(number);
}

std::string digits(unsigned number) {
    return (number < 10 ? "0" : "") + std::to_string(number);
}

bool isWord(const std::string& text) {
    return !text.empty() && text.find_first_of(" \t\"'") == std::string::npos;
}

}  // namespace

Answer listRuns(Admin& admin, std::vector<HistoryRun>& runs) {
    IHistory* const history = admin.platform().history();
    const Status status = history == nullptr ? kSuccess : history->list(runs);
    for (HistoryRun& run : runs) {
        HistoryChanges kept;
        // A run that was killed before its end or a commit point has not counted its rows.
        if (run.state != RunState::ended && run.counts.isEmpty() && history->read(run.number, kept) == kSuccess) {
            TouchedRows rows;
            std::all_of(kept.parts.begin(), kept.parts.end(), [&](const std::string& part) { return rows.add(part); });
            run.counts = rows.counts();
        }
    }
    return status == kSuccess ? kAnswerYes : admin.storeFault("cannot read the history", status);
}

std::vector<HistoryRun> unfinishedRuns(const std::vector<HistoryRun>& runs) {
    std::vector<HistoryRun> unfinished;
    for (const HistoryRun& run : runs) {
        std::erase_if(unfinished, [&](const HistoryRun& earlier) {
            return run.state == RunState::ended &&
                   (run.undoes == earlier.number ||
                    (run.status == kSuccess && run.program == earlier.program && run.arguments == earlier.arguments));
        });
        if (run.state == RunState::interrupted) {
            unfinished.push_back(run);
        }
    }
    return unfinished;
}

Answer findRun(Admin& admin, std::uint64_t number, HistoryRun& run) {
    std::vector<HistoryRun> runs;
    if (const Answer listed = listRuns(admin, runs); listed != kAnswerYes) {
        return listed;
    }
    const auto found =
        std::find_if(runs.begin(), runs.end(), [number](const HistoryRun& each) { return each.number == number; });
    if (found == runs.end()) {
        return admin.no("no such run: " + std::to_string(number) + " (see kz7admin history)");
    }
    run = *found;
    return kAnswerYes;
}

Answer readRun(Admin& admin, const HistoryRun& run, ChangeSet& changes) {
    HistoryChanges kept;
    const Status status = admin.platform().history()->read(run.number, kept);
    if (status != kSuccess && status != kInvalidData) {
        return admin.storeFault("cannot read " + runName(run.number), status);
    }
    TouchedRows rows;
    bool isWhole = status == kSuccess;
    ChangeSet before;  // the last part
    for (std::size_t part = 0; isWhole && part < kept.parts.size(); ++part) {
        if (kept.isLastUncertain && part + 1 == kept.parts.size()) {
            before = rows.changes();
        }
        isWhole = rows.add(kept.parts[part]);
    }
    if (!isWhole) {
        return admin.fault("the record of " + runName(run.number) + " is damaged");
    }
    changes = rows.changes();
    if (kept.isLastUncertain) {
        const ChangeSet back = inverse(changes);
        std::vector<const Change*> conflicts;
        std::string key;
        findConflicts(admin.registry(), admin.platform().storeIsOwn(), back, conflicts, key);
        changes = conflicts.empty() ? changes : before;
    }
    return kAnswerYes;
}

Answer readInverse(Admin& admin, const HistoryRun& run, ChangeSet& changes) {
    const Answer read = readRun(admin, run, changes);
    changes = inverse(std::move(changes));
    std::erase_if(changes, isRunState);
    return read;
}

std::string utcTime(std::int64_t seconds) {
    const std::chrono::sys_seconds time{std::chrono::seconds(seconds)};
    const auto day = std::chrono::floor<std::chrono::days>(time);
    const std::chrono::year_month_day date(day);
    const std::chrono::hh_mm_ss clock(time - day);
    return std::to_string(static_cast<int>(date.year())) + '-' + digits(static_cast<unsigned>(date.month())) + '-' +
           digits(static_cast<unsigned>(date.day())) + 'T' + digits(static_cast<unsigned>(clock.hours().count())) +
           ':' + digits(static_cast<unsigned>(clock.minutes().count())) + ':' +
           digits(static_cast<unsigned>(clock.seconds().count())) + 'Z';
}

std::string commandOf(const HistoryRun& run) {
    std::string command = shownText(run.program);
    for (const std::string& argument : run.arguments) {
        command += isWord(argument) ? ' ' + shownText(argument) : " \"" + shownText(argument) + '"';
    }
    return command;
}

std::string stateOf(const HistoryRun& run) {
    return run.state == RunState::running       ? "running"
           : run.state == RunState::interrupted ? "interrupted"
                                                : std::to_string(run.status);
}

void appendRun(const HistoryRun& run, JsonWriter& json) {
    const auto number = [](std::uint64_t value) { return value == 0 ? std::string("null") : std::to_string(value); };
    json.field("number", run.number);
    json.field("parent").raw(number(run.parent)).field("undoes").raw(number(run.undoes));
    json.field("begun", utcTime(run.begun)).field("ended", run.ended == 0 ? "" : utcTime(run.ended));
    json.field("user", run.user).field("host", run.host).field("program", run.program);
    json.field("arguments", run.arguments).field("state", run.state == RunState::ended ? "ended" : stateOf(run));
    json.field("status", run.status).field("values", run.counts.values).field("keys", run.counts.keys);
    json.field("services", run.counts.services).field("outside", run.outside);
}

}  // namespace kz7
