// Runs an installer program and shows a person its progress: the program's lines are read as the progress
// protocol, its questions are asked at the prompt.
#pragma once

#include <cstdint>
#include <map>
#include <mutex>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "install/admin/front/front_screen.h"
#include "install/admin/front/protocol_reader.h"
#include "install/platform/file_system.h"
#include "install/platform/process_host.h"
#include "install/platform/threads.h"

namespace kz7 {

// How far a run is, by the tasks that were announced. A phase is a run of tasks of one kind.
class FrontProgress {
public:
    void takeIds(const std::vector<std::string_view>& fields);
    void takeTimes(const std::vector<std::string_view>& fields);

    // The tasks that have ended belong to earlier phases. `now` is in seconds, from any origin.
    void beginPhase();
    void startTask(std::int32_t task, std::uint64_t now);
    void endTask(std::int32_t task, std::uint64_t now);
    void completePhase();

    // Percentage of the current phase, which is assumed to be the last; it never decreases within a phase. Below 0: no
    // task was announced.
    int percent();

    // Estimated seconds until all announced tasks have ended; 0: unknown, or overdue. An announced time counts as
    // seconds until tasks have ended; from then on the times are shares that are scaled by what those tasks took.
    std::uint64_t secondsLeft(std::uint64_t now) const;

private:
    std::uint64_t weight(std::int32_t task) const;

    std::vector<std::int32_t> ids_;
    std::map<std::int32_t, std::uint64_t> weights_;
    std::set<std::int32_t> ended_;
    std::set<std::int32_t> endedBefore_;
    int shown_ = -1;
    std::int32_t running_ = -1;
    std::uint64_t runningSince_ = 0;
    std::uint64_t measuredSeconds_ = 0;  // of tasks that have ended
    std::uint64_t measuredWeight_ = 0;
};

struct FrontPorts {
    IProcessHost& processes;
    IThreads& threads;
    IFileSystem& files;
    ITerminal& terminal;
    IConsole& console;
};

// Takes the program's lines and shows what they report; `answer` gets the line that answers a question. Lines come from
// one thread, ticks from any.
class FrontView {
public:
    FrontView(const FrontPorts& ports, FrontScreen& screen) : ports_(ports), screen_(screen) {}

    using Answerer = std::function<void(std::string_view line)>;
    void takeLine(std::string_view line, const Answerer& answer);

    // The last lines of the run.
    void end(std::string_view program, std::uint32_t exitCode);

    // Shows the time that has passed since the program began, in seconds.
    void tick(std::uint64_t seconds);

private:
    enum class Phase { none, installing, configuring, undoing };

    void enter(Phase phase);
    void showBar(std::string_view text);
    void showTask(const ProtocolEvent& event);
    void completeBar();
    std::string timeText() const;
    void takeEvent(const ProtocolEvent& event);
    void ask(std::string_view text, std::string_view proposal, const Answerer& answer);

    const FrontPorts& ports_;
    FrontScreen& screen_;
    FrontProgress progress_;
    Phase phase_ = Phase::none;
    std::string logFile_;
    std::uint64_t now_ = 0;
    std::mutex lock_;  // not held while an answer is awaited
};

// Runs a program to its end. `exitCode` is the program's; any status but kSuccess: it was not started.
Status runFront(const FrontPorts& ports, const std::vector<std::string>& command, std::uint32_t& exitCode);

}  // namespace kz7
