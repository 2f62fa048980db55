#include "install/admin/front/front.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <functional>
#include <numeric>

#include "install/platform/command_line.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::uint64_t kMaxTime = 1'000'000'000;  // of a task; what is longer counts as that
constexpr std::uint32_t kMaxAnswer = 1000;         // characters
constexpr std::string_view kAbort = "ABORT";

// The end of a program's output, written behind it once the program has ended: what it has started may hold
// the pipe open for as long as it runs.
constexpr char kEndText[] = "\0kz7admin front: the program has ended";
constexpr std::string_view kEndLine{kEndText, sizeof kEndText - 1};

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
            ports_.processes.write(writeEnd_.get(), "\n" + std::string(kEndLine) + "\n");
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
                take_(line);
            }
        };
        FixedBuffer<4096> piece;
        while (!hasEnded && ports_.processes.read(readEnd_.get(), piece) == kSuccess) {
            cutter.add(piece.view(), takeLine);
        }
        cutter.end(takeLine);
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

void FrontProgress::endTask(std::int32_t task) {
    ended_.insert(task);
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

void FrontView::showBar(std::string_view text) {
    static constexpr std::string_view kNames[] = {"", "Installing", "Configuring", "Undoing"};
    screen_.showBar({kNames[static_cast<int>(phase_)], phase_ == Phase::undoing ? -1 : progress_.percent(), text});
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
    switch (event.kind) {
        case EventKind::taskStart:
            enter(event.isInstallation ? Phase::installing : Phase::configuring);
            showBar(event.text);
            break;
        case EventKind::taskEnd:
            enter(event.isInstallation ? Phase::installing : Phase::configuring);
            progress_.endTask(event.task);
            showBar(std::string(event.text) + ", done");
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
        case EventKind::query:
            ask(event.text, event.proposal, answer);
            break;
        case EventKind::installEnd:
            logFile_ = event.text;
            break;
        case EventKind::other:
            screen_.showLine(event.text);
            break;
        case EventKind::installStart:
        case EventKind::taskCount:
        case EventKind::nothing:
            break;
    }
}

void FrontView::ask(std::string_view text, std::string_view proposal, const Answerer& answer) {
    screen_.showQuestion(text, proposal.empty() ? std::string("Answer, or ABORT: ")
                                                : "Answer, or ABORT [" + std::string(proposal) + "]: ");
    FixedBuffer<kMaxAnswer> line;
    isAsking_ = true;
    const bool answered = ports_.terminal.readLine(line) == kSuccess;
    isAsking_ = false;
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

Status runFront(const FrontPorts& ports, const std::vector<std::string>& command, std::uint32_t& exitCode) {
    FrontScreen screen(ports.console, ports.terminal);
    FrontView view(ports, screen);
    OwnedStream answersRead(ports.processes);
    OwnedStream answersWrite(ports.processes);
    StreamReader output(ports, [&](std::string_view line) {
        view.takeLine(line, [&](std::string_view answer) { ports.processes.write(answersWrite.get(), answer); });
    });
    StreamReader error(ports, [&](std::string_view line) { screen.showErrorLine(line); });
    for (const Status status : {openAnswers(ports.processes, answersRead, answersWrite), output.open(), error.open()}) {
        if (status != kSuccess) {
            return status;
        }
    }
    const std::string commandLine = joinArguments(command);
    OwnedProcess program{ports.processes, {}};
    ports.terminal.leaveInterruptsToOthers(true);
    Status status = ports.processes.startProcess(
        {commandLine, {}, output.writeEnd(), error.writeEnd(), answersRead.get()}, program.information);
    answersRead.reset();
    if (status == kSuccess) {
        status = output.start();
    }
    if (status == kSuccess) {
        status = error.start();
    }
    if (status == kSuccess) {
        ports.processes.waitProcess(program.information.process, kInfiniteWait);
        if (view.isAsking()) {
            screen.showAnswer("");
            screen.showErrorLine("The program has ended; press Enter.");
        }
        output.finish();
        error.finish();
        status = ports.processes.exitCode(program.information.process, exitCode);
        view.end(command.front(), exitCode);
    }
    ports.terminal.leaveInterruptsToOthers(false);
    return status;
}

}  // namespace kz7
