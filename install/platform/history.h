// The history port: the runs of our programs that changed the store, each with what it changed, so that it can be shown
// and taken back.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "install/platform/status.h"

namespace kz7 {

// How many rows a run changed, those of services apart.
struct ChangeCounts {
    std::size_t values = 0;
    std::size_t keys = 0;
    std::size_t services = 0;

    bool isEmpty() const { return values + keys + services == 0; }
};

// What is known of a run when it begins.
struct HistoryStart {
    std::string program;
    std::vector<std::string> arguments;
    bool startsPrograms = false;  // it has several commit points, and other programs may see its entry unfinished
    std::uint64_t undoes = 0;     // the run that it takes back; 0: none
};

enum class RunState { ended, running, interrupted };

struct HistoryRun : HistoryStart {
    std::uint64_t number = 0;
    std::uint64_t parent = 0;  // the run that started it; 0: none
    std::int64_t begun = 0;    // seconds since 1970, UTC
    std::int64_t ended = 0;    // 0: it is running or was interrupted
    std::string user;
    std::string host;
    Status status = kSuccess;  // of a run that ended
    RunState state = RunState::ended;
    ChangeCounts counts;
    std::vector<std::string> outside;  // what it did apart from the store and cannot be taken back
    bool isForeign = false;            // recorded on another machine
};

// What a run changed, in the order in which it was recorded.
struct HistoryChanges {
    std::vector<std::string> parts;
    bool isLastUncertain = false;  // the run was interrupted while it made the last one, or just before
};

// One process records one run. Nothing is written before its first change, and a run that changed nothing is not kept.
// Faults of recording are the store's where the history is part of it; elsewhere the run goes on without a record.
class IHistory {
public:
    virtual ~IHistory() = default;

    // Whether runs are recorded now.
    virtual bool isOn() = 0;

    // Switches recording on or off. kCallNotImplemented: it is always on.
    virtual Status turn(bool on) = 0;

    // Describes the run of this process.
    virtual void begin(const HistoryStart& run) = 0;

    // Whether each change is passed to append() before it is made; else changes are passed before the commit point that
    // makes them final.
    virtual bool takesEachChange() = 0;
    virtual Status append(std::string part) = 0;

    // Called before each commit point with the changes of the run up to it.
    virtual Status settle(const ChangeCounts& counts) = 0;

    // Adds a line to what cannot be taken back.
    virtual void note(std::string_view outside) = 0;

    // Ends the run of this process.
    virtual void end(Status status) = 0;

    // All runs that are kept, the oldest first.
    virtual Status list(std::vector<HistoryRun>& runs) = 0;

    // kInvalidData: what is kept of it is damaged.
    virtual Status read(std::uint64_t number, HistoryChanges& changes) = 0;

    // Removes the oldest runs, those before `number`.
    virtual Status trim(std::uint64_t number) = 0;
};

// Texts in one, each with a NUL behind it, for the implementations.
std::string joinTexts(const std::vector<std::string>& texts);
std::vector<std::string> splitTexts(std::string_view all);

}  // namespace kz7
