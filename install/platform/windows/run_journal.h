// The file of a run's history: records that are appended one by one, each with a sum over it and all before it, so that
// a torn end and a changed record are noticed.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "install/platform/history.h"

namespace kz7 {

enum class JournalRecord : char { run = 'R', change = 'C', note = 'N', end = 'E' };

class JournalWriter {
public:
    // The bytes of the next record.
    std::string record(JournalRecord kind, std::string_view content);

private:
    std::uint64_t sum_ = 0;  // of all before
};

// What a journal begins with: the run, and the machine that it ran on.
std::string journalHead(JournalWriter& writer, const HistoryRun& run, std::string_view machine);
std::string journalEnd(JournalWriter& writer, Status status, std::int64_t ended, const ChangeCounts& counts);

// Reads a journal of this machine or another one. Of a torn record at the end nothing is read. kFileNotFound: its run
// has not changed anything; kInvalidData: it is not a journal, or it was changed; `run` may be read in part.
Status readJournal(std::string_view bytes, std::string_view machine, HistoryRun& run, HistoryChanges& changes);

}  // namespace kz7
