// Runs an installer program and shows a person its progress: the program's lines are read as the progress
// protocol, its questions are asked at the prompt.
#pragma once

#include <atomic>
#include <cstdint>
#include <map>
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

    // What is done so far belongs to earlier phases.
    void beginPhase();
    void endTask(std::int32_t task);
    void completePhase();

    // Of the phase, which is taken to be all that is left; it never goes back in a phase. Below 0: no task was
    // announced.
    int percent();

private:
    std::uint64_t weight(std::int32_t task) const;

    std::vector<std::int32_t> ids_;
    std::map<std::int32_t, std::uint64_t> weights_;
    std::set<std::int32_t> ended_;
    std::set<std::int32_t> endedBefore_;
    int shown_ = -1;
};

struct FrontPorts {
    IProcessHost& processes;
    IThreads& threads;
    IFileSystem& files;
    ITerminal& terminal;
    IConsole& console;
};

// Takes the program's lines and shows what they tell; `answer` gets the line that answers a question.
class FrontView {
public:
    FrontView(const FrontPorts& ports, FrontScreen& screen) : ports_(ports), screen_(screen) {}

    using Answerer = std::function<void(std::string_view line)>;
    void takeLine(std::string_view line, const Answerer& answer);

    // The last lines of the run.
    void end(std::string_view program, std::uint32_t exitCode);

    bool isAsking() const { return isAsking_; }

private:
    enum class Phase { none, installing, configuring, undoing };

    void enter(Phase phase);
    void showBar(std::string_view text);
    void completeBar();
    void ask(std::string_view text, std::string_view proposal, const Answerer& answer);

    const FrontPorts& ports_;
    FrontScreen& screen_;
    FrontProgress progress_;
    Phase phase_ = Phase::none;
    std::string logFile_;
    std::atomic<bool> isAsking_ = false;
};

// Runs a program to its end. `exitCode` is the program's; any status but kSuccess: it was not started.
Status runFront(const FrontPorts& ports, const std::vector<std::string>& command, std::uint32_t& exitCode);

}  // namespace kz7
