#include "install/admin/front/front.h"

#include <algorithm>
#include <atomic>
#include <charconv>
#include <chrono>
#include <functional>
#include <new>
#include <numeric>

#include "install/admin/front/command_words.h"
#include "install/platform/encoding.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::uint64_t kMaxTime = 1'000'000'000;  // of a task; what is longer counts as that
constexpr std::uint32_t kMaxAnswer = 1000;         // characters
constexpr std::uint32_t kTick = 1000;              // milliseconds between two looks at the time
constexpr std::string_view kAbort = "ABORT";

// Marks the end of a program's output, written after it once the program has ended: programs that it has started may
// keep the pipe open.
constexpr char kEndText[] = "\n\0kz7admin front: the program has ended\n";
constexpr std::string_view kEndMark{kEndText, sizeof kEndText - 1};
constexpr std::string_view kEndLine = kEndMark.substr(1, kEndMark.size() - 2);

// Reads one of the program's streams on a thread of its own.
class StreamReader {
public:
    StreamReader(const FrontPorts& ports, std::function<void(std::string_view)> take)
        : ports_(ports), take_(std::move(take)), readEnd_(ports.processes), writeEnd_(ports.processes) {}
    ~StreamReader() { finish(); }
    StreamReader(const StreamReader&) = delete;
    StreamReader& operator=(const StreamReader&) = delete;

    Status open() {
        OwnedStream inherited(ports_.processes);
        Status status = ports_.processes.createPipe(inherited.receive(), writeEnd_.receive());
        return status != kSuccess ? status : ports_.processes.duplicate(inherited.get(), readEnd_.receive());
    }
    StreamHandle writeEnd() const { return writeEnd_.get(); }

    Status start() {
        auto record = std::make_unique<ThreadStart>(ThreadStart{run, this});
        std::uint32_t id = 0;
        return ports_.threads.startThread(record, 0, id, thread_);
    }

    // Once the program has ended: reads what it left, and ends.
    void finish() {
        if (thread_ != ThreadHandle::none) {
            isEnding_ = true;
            ports_.processes.write(writeEnd_.get(), kEndMark);
            ports_.threads.waitThread(thread_);
            ports_.threads.closeThread(std::exchange(thread_, ThreadHandle::none));
        }
    }

private:
    static void run(void* self) { static_cast<StreamReader*>(self)->read(); }

    void read() {
        LineCutter cutter;
        bool hasEnded = false;
        const auto takeLine = [&](std::string_view line) {
            hasEnded = hasEnded || (isEnding_ && line == kEndLine);
            if (!hasEnded && !line.empty()) {
                take_(textFromNarrow(line));
            }
        };
        FixedBuffer<4096> piece;
        Status status = kSuccess;
        while (!hasEnded && status == kSuccess) {
            status = ports_.processes.read(readEnd_.get(), piece);
            // What there is no memory for is not shown; a reader that ended would keep the program waiting.
            try {
                if (status == kSuccess) {
                    cutter.add(piece.view(), takeLine);
                } else {
                    cutter.end(takeLine);
                }
            } catch (const std::bad_alloc&) {
                hasEnded = isEnding_;
            }
        }
    }

    const FrontPorts& ports_;
    std::function<void(std::string_view)> take_;
    OwnedStream readEnd_;
    OwnedStream writeEnd_;
    ThreadHandle thread_ = ThreadHandle::none;
    std::atomic<bool> isEnding_ = false;
};

struct OwnedProcess {
    ~OwnedProcess() {
        processes.closeProcess(information.process);
        if (information.mainThread != ProcessHandle::none) {
            processes.closeProcess(information.mainThread);
        }
    }
    IProcessHost& processes;
    ProcessInformation information;
};

// The end of a pipe that the program reads its answers from, and ours, which it does not inherit.
Status openAnswers(IProcessHost& processes, OwnedStream& readEnd, OwnedStream& writeEnd) {
    OwnedStream inherited(processes);
    const Status status = processes.createPipe(readEnd.receive(), inherited.receive());
    return status != kSuccess ? status : processes.duplicate(inherited.get(), writeEnd.receive());
}

}  // namespace

void FrontProgress::takeIds(const std::vector<std::string_view>& fields) {
    ids_.clear();
    weights_.clear();
    for (const std::string_view field : fields) {
        std::int32_t id = -1;
        std::from_chars(field.data(), field.data() + field.size(), id);
        ids_.push_back(id);
        weights_[id] = 1;
    }
}

void FrontProgress::takeTimes(const std::vector<std::string_view>& fields) {
    for (std::size_t i = 0; i < std::min(ids_.size(), fields.size()); ++i) {
        std::uint64_t time = 0;
        std::from_chars(fields[i].data(), fields[i].data() + fields[i].size(), time);
        weights_[ids_[i]] = std::clamp<std::uint64_t>(time, 1, kMaxTime);
    }
}

void FrontProgress::beginPhase() {
    endedBefore_ = ended_;
    shown_ = -1;
}

void FrontProgress::completePhase() {
    if (!weights_.empty()) {
        shown_ = 100;
    }
}

void FrontProgress::startTask(std::int32_t task, std::uint64_t now) {
    running_ = task;
    runningSince_ = now;
}

void FrontProgress::endTask(std::int32_t task, std::uint64_t now) {
    if (ended_.insert(task).second && task == running_) {
        measuredSeconds_ += now - runningSince_;
        measuredWeight_ += weight(task);
    }
    running_ = -1;
}

std::uint64_t FrontProgress::secondsLeft(std::uint64_t now) const {
    const auto seconds = [this](std::uint64_t weight) {
        return measuredSeconds_ == 0 || measuredWeight_ == 0 ? weight : weight * measuredSeconds_ / measuredWeight_;
    };
    std::uint64_t later = 0;
    for (const auto& [task, time] : weights_) {
        later += ended_.contains(task) || task == running_ ? 0 : time;
    }
    const std::uint64_t whole = seconds(weight(running_));
    const std::uint64_t passed = running_ == -1 ? 0 : now - runningSince_;
    return seconds(later) + (whole > passed ? whole - passed : 0);
}

std::uint64_t FrontProgress::weight(std::int32_t task) const {
    const auto found = weights_.find(task);
    return found != weights_.end() ? found->second : 0;
}

int FrontProgress::percent() {
    std::uint64_t all = 0;
    std::uint64_t done = 0;
    for (const auto& [task, time] : weights_) {
        if (!endedBefore_.contains(task)) {
            all += time;
            done += ended_.contains(task) ? time : 0;
        }
    }
    if (all != 0) {
        shown_ = std::max(shown_, static_cast<int>(100 * done / all));
    }
    return shown_;
}

void FrontView::enter(Phase phase) {
    if (phase != phase_) {
        if (phase != Phase::undoing) {
            completeBar();
        }
        screen_.leaveBar();
        progress_.beginPhase();
        phase_ = phase;
    }
}

// Minutes and seconds: "12:05".
std::string FrontView::timeText() const {
    const auto shown = [](std::uint64_t seconds) {
        const std::string rest = std::to_string(seconds % 60);
        return std::to_string(seconds / 60) + (rest.size() == 1 ? ":0" : ":") + rest;
    };
    if (now_ == 0) {
        return {};
    }
    const std::uint64_t left = phase_ == Phase::undoing ? 0 : progress_.secondsLeft(now_);
    return shown(now_) + (left == 0 ? "" : ", " + shown(left) + " left");
}

void FrontView::showBar(std::string_view text) {
    static constexpr std::string_view kNames[] = {"", "Installing", "Configuring", "Undoing"};
    const std::string time = timeText();
    screen_.showBar(
        {kNames[static_cast<int>(phase_)], phase_ == Phase::undoing ? -1 : progress_.percent(), text, time});
}

void FrontView::tick(std::uint64_t seconds) {
    const std::lock_guard<std::mutex> held(lock_);
    now_ = seconds;
    screen_.showTime(timeText());
}

// A phase that is over is whole, whatever share of the tasks it turned out to have.
void FrontView::completeBar() {
    if (phase_ == Phase::installing || phase_ == Phase::configuring) {
        progress_.completePhase();
        showBar("done");
    }
}

void FrontView::takeLine(std::string_view line, const Answerer& answer) {
    const ProtocolEvent event = readProtocolLine(line);
    if (event.kind == EventKind::query) {
        ask(event.text, event.proposal, answer);
        return;
    }
    const std::lock_guard<std::mutex> held(lock_);
    takeEvent(event);
}

void FrontView::showTask(const ProtocolEvent& event) {
    enter(event.isInstallation ? Phase::installing : Phase::configuring);
    if (event.kind == EventKind::taskStart) {
        progress_.startTask(event.task, now_);
        showBar(event.text);
    } else {
        progress_.endTask(event.task, now_);
        showBar(std::string(event.text) + ", done");
    }
}

void FrontView::takeEvent(const ProtocolEvent& event) {
    switch (event.kind) {
        case EventKind::taskStart:
        case EventKind::taskEnd:
            showTask(event);
            break;
        case EventKind::taskIds:
            progress_.takeIds(event.fields);
            break;
        case EventKind::taskTimes:
            progress_.takeTimes(event.fields);
            break;
        case EventKind::undoStart:
            enter(Phase::undoing);
            showBar("what was done is taken back");
            break;
        case EventKind::undoEnd:
            showBar("done");
            break;
        case EventKind::error:
            screen_.showFailure("error: " + std::string(event.text));
            break;
        case EventKind::installEnd:
            logFile_ = event.text;
            break;
        case EventKind::other:
            screen_.showLine(event.text);
            break;
        case EventKind::installStart:
        case EventKind::taskCount:
        case EventKind::query:
        case EventKind::nothing:
            break;
    }
}

void FrontView::ask(std::string_view text, std::string_view proposal, const Answerer& answer) {
    screen_.showQuestion(text, proposal.empty() ? std::string("Answer, or ABORT: ")
                                                : "Answer, or ABORT [" + std::string(proposal) + "]: ");
    TextBuffer<kMaxAnswer> line;
    const Status status = ports_.terminal.readLine(line);
    if (status == kOperationAborted) {
        screen_.showAnswer("");  // the program has ended: no answer reaches it
        return;
    }
    const bool answered = status == kSuccess;
    const std::string_view typed = line.text().empty() ? proposal : line.text();
    const bool aborts = !answered || equalsIgnoreCase(line.text(), kAbort);
    // What a person types at a terminal is on the screen already.
    if (!answered || !ports_.terminal.look(TerminalStream::input).terminal) {
        screen_.showAnswer(aborts ? kAbort : typed);
    }
    answer(aborts ? std::string(kAbort) + '\n' : "RESPONSE :: " + std::string(typed) + '\n');
}

void FrontView::end(std::string_view program, std::uint32_t exitCode) {
    if (exitCode == 0) {
        completeBar();
    }
    screen_.leaveBar();
    if (!logFile_.empty()) {
        screen_.showLine("The log is " + ports_.files.shownPath(logFile_));
    }
    if (exitCode == 0) {
        screen_.showLine("Done.");
    } else {
        screen_.showFailure(compose("%s ended with exit code %u.", {program, exitCode}));
    }
}

namespace {

// One run of a program: its pipes, the readers of its streams, and the display.
class FrontRun {
public:
    explicit FrontRun(const FrontPorts& ports)
        : ports_(ports),
          screen_(ports.console, ports.terminal),
          view_(ports, screen_),
          answersRead_(ports.processes),
          answersWrite_(ports.processes),
          output_(ports, [this](std::string_view line) { takeLine(line); }),
          error_(ports, [this](std::string_view line) { screen_.showErrorLine(line); }),
          program_{ports.processes, {}} {
        ports_.terminal.leaveInterruptsToOthers(true);
    }
    FrontRun(const FrontRun&) = delete;
    FrontRun& operator=(const FrontRun&) = delete;
    ~FrontRun() { ports_.terminal.leaveInterruptsToOthers(false); }

    Status start(const std::vector<std::string>& command) {
        Status status = openAnswers(ports_.processes, answersRead_, answersWrite_);
        if (status == kSuccess) {
            status = output_.open();
        }
        if (status == kSuccess) {
            status = error_.open();
        }
        if (status == kSuccess) {
            const std::string commandLine = joinArguments(command);
            status = ports_.processes.startProcess(
                {commandLine, {}, output_.writeEnd(), error_.writeEnd(), answersRead_.get()}, program_.information);
        }
        answersRead_.reset();
        if (status == kSuccess) {
            status = output_.start();
        }
        return status == kSuccess ? error_.start() : status;
    }

    Status finish(const std::string& name, std::uint32_t& exitCode) {
        waitForEnd();
        // A question of a program that has ended has no use, and its reader waits for the answer.
        ports_.terminal.endReading();
        output_.finish();
        error_.finish();
        const Status status = ports_.processes.exitCode(program_.information.process, exitCode);
        view_.end(name, exitCode);
        return status;
    }

private:
    void takeLine(std::string_view line) {
        view_.takeLine(line, [this](std::string_view answer) {
            ports_.processes.write(answersWrite_.get(), narrowFromText(answer));
        });
    }

    void waitForEnd() {
        using Clock = std::chrono::steady_clock;
        const auto begin = Clock::now();
        while (ports_.processes.waitProcess(program_.information.process, kTick) == kWaitTimedOut) {
            const auto passed = std::chrono::duration_cast<std::chrono::seconds>(Clock::now() - begin);
            view_.tick(static_cast<std::uint64_t>(passed.count()));
        }
    }

    const FrontPorts& ports_;
    FrontScreen screen_;
    FrontView view_;
    OwnedStream answersRead_;
    OwnedStream answersWrite_;
    StreamReader output_;
    StreamReader error_;
    OwnedProcess program_;
};

}  // namespace

Status runFront(const FrontPorts& ports, const std::vector<std::string>& command, std::uint32_t& exitCode) {
    FrontRun run(ports);
    const Status status = run.start(command);
    return status == kSuccess ? run.finish(command.front(), exitCode) : status;
}

}  // namespace kz7
