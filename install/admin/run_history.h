// The recorded runs as the commands use them. Errors are reported here.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "install/admin/admin.h"
#include "install/admin/formats/json_text.h"
#include "install/platform/history.h"
#include "install/src/registry/change_set.h"

namespace kz7 {

Answer listRuns(Admin& admin, std::vector<HistoryRun>& runs);

// The interrupted runs that no later run took back or repeated.
std::vector<HistoryRun> unfinishedRuns(const std::vector<HistoryRun>& runs);

// kAnswerNo: no run has that number.
Answer findRun(Admin& admin, std::uint64_t number, HistoryRun& run);

// What a run changed. Of one that was interrupted, the change that may or may not have been made is part of it if the
// machine looks so.
Answer readRun(Admin& admin, const HistoryRun& run, ChangeSet& changes);

// What takes a run back, without the states of services that ran.
Answer readInverse(Admin& admin, const HistoryRun& run, ChangeSet& changes);

// 2026-11-22T08:00:00Z
std::string utcTime(std::int64_t seconds);

// The program with its arguments, quoted where they have blanks.
std::string commandOf(const HistoryRun& run);

// "0", "running", "interrupted".
std::string stateOf(const HistoryRun& run);

// Its fields without the braces.
void appendRun(const HistoryRun& run, JsonWriter& json);

}  // namespace kz7
