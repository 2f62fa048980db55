#include "install/runtime/install_process.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <new>

#include "install/platform/encoding.h"
#include "install/runtime/guarded.h"

namespace kz7 {
namespace {

constexpr std::size_t kFirstCapacity = 1024;   // bytes of captured text before the first doubling
constexpr std::uint32_t kPieceSize = 512;      // bytes of one read from a pipe
constexpr std::uint32_t kShortPathSize = 261;  // characters of a short path with its terminator
constexpr std::string_view kWakingBytes("\0\0\0", 3);
constexpr std::string_view kWrapperProgram = "kz7.exe";

// clang-format off
struct ProgramType { std::string_view ending; bool quoted; };
constexpr ProgramType kProgramTypes[] = {  // in the order of the search, not by their place in a command
    {".exe", true },
    {".bat", false},
    {".com", true },
    {".cmd", false},
};
// clang-format on

// The message text of the last process that was waited for.
FixedText<256> lastMessageText;

std::size_t findIgnoringCase(std::string_view text, std::string_view part) {
    const auto found = std::search(text.begin(), text.end(), part.begin(), part.end(),
                                   [](char a, char b) { return foldUpper(a) == foldUpper(b); });
    return found != text.end() ? static_cast<std::size_t>(found - text.begin()) : std::string_view::npos;
}

}  // namespace

// The text that a reader has collected; only the reader's until it was joined.
class InstallProcess::CollectedText {
public:
    CollectedText() = default;
    ~CollectedText() { std::free(room_); }
    CollectedText(const CollectedText&) = delete;
    CollectedText& operator=(const CollectedText&) = delete;

    // False: no memory; the text so far is kept.
    bool begin() { return grow(kFirstCapacity); }

    bool append(std::string_view piece) {
        while (length_ + piece.size() > capacity_) {
            if (!grow(capacity_ * 2)) {
                return false;
            }
        }
        std::memcpy(room_ + length_, piece.data(), piece.size());
        length_ += piece.size();
        return true;
    }

    void terminate() { room_[length_] = '\0'; }

    bool begun() const { return room_ != nullptr; }
    std::string_view view() const { return begun() ? std::string_view(room_) : std::string_view{}; }

private:
    bool grow(std::size_t capacity) {
        // The terminator of a text that fills its capacity needs one byte more.
        void* room = std::realloc(room_, capacity + 1);
        if (room == nullptr) {
            return false;
        }
        room_ = static_cast<char*>(room);
        capacity_ = capacity;
        return true;
    }

    char* room_ = nullptr;
    std::size_t capacity_ = 0;
    std::size_t length_ = 0;
};

// Restores the standard handles at the end of a run.
class SlotsRestored {
public:
    explicit SlotsRestored(IProcessHost& host) : host_(host) {
        host_.getSlot(StandardSlot::output, output_);
        host_.getSlot(StandardSlot::error, error_);
    }
    SlotsRestored(const SlotsRestored&) = delete;
    SlotsRestored& operator=(const SlotsRestored&) = delete;
    ~SlotsRestored() {
        // Deliberate: both are restored through the output slot, which ends with the old standard error, and the error
        // slot still names a closed pipe; programs that inspect the slots afterwards depend on it. Nothing may write
        // through a slot, close it or test it.
        host_.setSlot(StandardSlot::output, output_);
        host_.setSlot(StandardSlot::output, error_);
    }

private:
    IProcessHost& host_;
    StreamHandle output_ = StreamHandle::none;
    StreamHandle error_ = StreamHandle::none;
};

// The argument of a reader thread, which frees it. A reader ends by closing its read end, so that no writer waits for a
// reader that has ended.
struct InstallProcess::Reader {
    IProcessHost& host;
    OwnedStream readEnd;
    Collected text;
    std::shared_ptr<const std::atomic<bool>> stop;

    static void run(void* argument) {
        const std::unique_ptr<Reader> reader(static_cast<Reader*>(argument));
        if (reader->text->begin()) {
            reader->collect();
            reader->text->terminate();
        }
    }

    void collect() {
        FixedBuffer<kPieceSize> piece;
        bool kept = true;
        // Deliberate: a read of 0 bytes ends the reader, and the bytes of the read that sees the stop flag are dropped,
        // because the waking bytes are among them.
        while (host.read(readEnd.get(), piece) == kSuccess && piece.size != 0 && !stop->load()) {
            // Without memory the rest is read and dropped, so that the program can end normally.
            kept = kept && text->append(piece.view());
        }
    }
};

InstallProcess::InstallProcess(IProcessHost& host, IThreads& threads, IReportSink& sink, const char* command,
                               const char* workingDirectory, bool wrapperMode, bool wrapperSwitch, bool)
    : host_(host),
      threads_(threads),
      sink_(sink),
      wrapperSwitch_(wrapperSwitch),
      errorWriteEnd_(host),
      outputWriteEnd_(host),
      wrapperMode_(wrapperMode) {
    built_ = guarded([&] {
        workingDirectory_ = workingDirectory != nullptr ? workingDirectory : "";
        return build(command);
    });
    if (built_ == kNoProgramType) {
        setCommandLine(command);
    }
}

InstallProcess::~InstallProcess() {
    giveUpRun();
}

std::string_view InstallProcess::lastMessage() {
    return lastMessageText.view();
}

Status InstallProcess::buildCommandLine(IProcessHost& host, CommandLine& commandLine, std::string_view command) {
    std::string whole;
    const Status status = guarded([&] { return wholeCommandLine(host, whole, command); });
    commandLine.assign(status == kSuccess ? std::string_view(whole) : std::string_view{});
    return status;
}

Status InstallProcess::wholeCommandLine(IProcessHost& host, std::string& commandLine, std::string_view command) {
    commandLine.clear();
    for (const ProgramType& type : kProgramTypes) {
        const std::size_t found = findIgnoringCase(command, type.ending);
        if (found == std::string_view::npos) {
            continue;
        }
        const std::string_view program = command.substr(0, found + type.ending.size());
        std::string_view rest = command.substr(program.size());
        if (type.quoted) {
            commandLine.append(program.starts_with('"') ? "" : "\"");
            commandLine.append(program);
            commandLine.append("\"");
            rest.remove_prefix(rest.starts_with('"') ? 1 : 0);
        } else {
            commandLine.append(program);
            TextBuffer<kShortPathSize> shortened;
            // Deliberate: a leading quotation mark goes into the shortening, which then finds no such file
            // and leaves the text alone; the closing mark that follows makes it whole again.
            if (host.shortPath(commandLine, shortened) == kSuccess) {
                commandLine.assign(shortened.view());
            }
        }
        commandLine.append(rest);
        return kSuccess;
    }
    return kNoProgramType;
}

// Builds the command line of the object; kNoProgramType leaves it empty.
Status InstallProcess::build(const char* command) {
    setCommandLine({});
    if (command == nullptr) {
        return kSuccess;
    }
    std::string whole;
    const Status status = wholeCommandLine(host_, whole, wrapperMode_ ? kWrapperProgram : std::string_view(command));
    if (wrapperMode_) {
        statement_.assign(command);
        whole.append(wrapperSwitch_ ? " -a -v \"" : " -ec -v \"").append(command).append("\"");
    } else {
        timeout_ = kInfiniteWait;
    }
    setCommandLine(whole);
    return status;
}

void InstallProcess::setCommandLine(std::string_view whole) {
    commandLineCut_ = !commandLine_.assign(whole);
}

Status InstallProcess::setCommand(const char* command) {
    giveUpRun();
    built_ = guarded([&] { return build(command); });
    return built_;
}

Status InstallProcess::execute(bool wait, bool trace) {
    giveUpRun();
    if (trace) {
        sink_.trace(kTraceError, "InstallProcess::execute", 10, kSuccess, commandLine_.view());
    }
    if (built_ == kNoMemory) {
        return kNoMemory;
    }
    const SlotsRestored restored(host_);
    const Status status = guarded([&] { return run(wait); });
    if (!executed_) {
        giveUpRun();
    }
    return status;
}

Status InstallProcess::run(bool wait) {
    OwnedStream outputReadEnd(host_);
    OwnedStream errorReadEnd(host_);
    if (openPipes(outputReadEnd, errorReadEnd) != kSuccess) {
        // Deliberate: not reported here; the wait that follows returns kNotExecuted.
        closeWriteEnds();
        return kSuccess;
    }
    stop_ = std::make_shared<std::atomic<bool>>(false);
    // Deliberate: only the second start is the result, and the program is started in any case; a stream without a
    // reader is a closed pipe to the program.
    startReader(outputReadEnd, standardOutputText_, outputReader_);
    const Status status = startReader(errorReadEnd, standardErrorText_, errorReader_);
    const ProcessStart start{commandLine_.view(), workingDirectory_, outputWriteEnd_.get(), errorWriteEnd_.get()};
    // Deliberate: a truncated command line is not run; it would do something else than the command.
    const Status created = commandLineCut_ ? kFilenameExceedsRange : host_.startProcess(start, process_);
    if (wait) {
        waitOrWake();
    }
    // Deliberate: also set for a program that could not be started; the wait then returns kExitCodeUnavailable.
    executed_ = true;
    if (created != kSuccess) {
        timeout_ = 0;
        waitOrWake();
        joinReader(outputReader_);
        joinReader(errorReader_);
    }
    return status;
}

Status InstallProcess::openPipes(OwnedStream& outputEnd, OwnedStream& errorEnd) {
    OwnedStream outputInheritable(host_);
    OwnedStream errorInheritable(host_);
    Status status = host_.createPipe(outputInheritable.receive(), outputWriteEnd_.receive());
    if (status == kSuccess) {
        status = host_.createPipe(errorInheritable.receive(), errorWriteEnd_.receive());
    }
    if (status == kSuccess) {
        status = host_.setSlot(StandardSlot::output, outputWriteEnd_.get());
    }
    if (status == kSuccess) {
        status = host_.setSlot(StandardSlot::error, errorWriteEnd_.get());
    }
    // The program must not hold the read ends, or a reader's end would never be seen.
    if (status == kSuccess) {
        status = host_.duplicate(outputInheritable.get(), outputEnd.receive());
    }
    if (status == kSuccess) {
        status = host_.duplicate(errorInheritable.get(), errorEnd.receive());
    }
    return status;
}

Status InstallProcess::startReader(OwnedStream& readEnd, Collected& text, ThreadRecord& record) {
    text = std::make_shared<CollectedText>();
    auto reader = std::make_unique<Reader>(Reader{host_, std::move(readEnd), text, stop_});
    const Status status = ureCreateThread(threads_, sink_, Reader::run, reader.get(), &record);
    if (status == kSuccess) {
        static_cast<void>(reader.release());
    } else {
        text.reset();
    }
    return status;
}

// Waits for the program up to the timeout and stops the readers of one that did not end.
// Deliberate: the program itself is not killed, and programs that it has started keep its readers waiting; an installer
// must not interrupt a configuration.
void InstallProcess::waitOrWake() {
    if (host_.waitProcess(process_.process, timeout_) != kSuccess) {
        wakeReaders();
    }
    closeWriteEnds();
}

void InstallProcess::wakeReaders() {
    if (stop_ != nullptr) {
        stop_->store(true);
    }
    for (const OwnedStream* end : {&outputWriteEnd_, &errorWriteEnd_}) {
        if (*end) {
            host_.write(end->get(), kWakingBytes);
        }
    }
}

void InstallProcess::closeWriteEnds() {
    outputWriteEnd_.reset();
    errorWriteEnd_.reset();
}

Status InstallProcess::waitForCompletion(std::uint32_t& exitCode, std::uint32_t timeout) {
    timeout_ = timeout;
    waitOrWake();
    if (!executed_) {
        exitCode = kNotExecuted;
        return kNotExecuted;
    }
    lastMessageText = messageText_;
    if (!messageText_.empty()) {
        exitCode = static_cast<std::uint32_t>(resultCode_);
        return kSuccess;
    }
    std::uint32_t code = kExitCodeUnavailable;
    const Status status = host_.exitCode(process_.process, code);
    joinReader(outputReader_);
    joinReader(errorReader_);
    exitCode = code;
    return status == kSuccess ? kSuccess : kExitCodeUnavailable;
}

// True if the reader has ended or was never started: its text may then be read.
bool InstallProcess::joinReader(ThreadRecord& record) {
    if (record.handle == ThreadHandle::none) {
        return true;
    }
    if (threads_.waitThread(record.handle) != kSuccess) {
        return false;
    }
    threads_.closeThread(std::exchange(record.handle, ThreadHandle::none));
    return true;
}

std::string_view InstallProcess::collected(const Collected& text, ThreadRecord& record) {
    return joinReader(record) && text != nullptr ? text->view() : std::string_view{};
}

Status InstallProcess::copyOut(const Collected& text, ThreadRecord& record, char* buffer, std::size_t size) {
    const std::string_view all = collected(text, record);
    if (size != 0) {
        buffer[all.substr(0, size - 1).copy(buffer, size - 1)] = '\0';
    }
    // Deliberate: in a buffer of exactly the text's length the terminator replaces the last character, and the result
    // is kBufferTooSmall; callers expect it.
    return all.data() == nullptr || all.size() < size ? kSuccess : kBufferTooSmall;
}

Status InstallProcess::copyStandardOutput(char* buffer, std::size_t size) {
    return copyOut(standardOutputText_, outputReader_, buffer, size);
}

Status InstallProcess::copyStandardError(char* buffer, std::size_t size) {
    return copyOut(standardErrorText_, errorReader_, buffer, size);
}

std::size_t InstallProcess::standardOutputLength() {
    return collected(standardOutputText_, outputReader_).size();
}

void InstallProcess::postOutput(std::string_view source, std::uint32_t flags) {
    postStandardOutput(source, flags);
    postStandardError(source, flags);
}

void InstallProcess::postStandardOutput(std::string_view source, std::uint32_t flags) {
    post(kStandardOutputMessage, collected(standardOutputText_, outputReader_), source, flags);
}

void InstallProcess::postStandardError(std::string_view source, std::uint32_t flags) {
    post(kStandardErrorMessage, collected(standardErrorText_, errorReader_), source, flags);
}

void InstallProcess::post(std::uint32_t number, std::string_view text, std::string_view source, std::uint32_t flags) {
    if (!text.empty()) {
        sink_.post(number, flags | kPostedByProcess, source, textFromNarrow(text));
    }
}

// Releases the resources of an earlier run; none of its readers uses the object afterwards.
void InstallProcess::giveUpRun() {
    wakeReaders();
    closeWriteEnds();
    for (ThreadRecord* record : {&outputReader_, &errorReader_}) {
        if (!joinReader(*record)) {
            // A reader that could not be joined shares ownership of its text.
            threads_.closeThread(record->handle);
        }
        *record = {};
    }
    for (const ProcessHandle handle : {process_.process, process_.mainThread}) {
        if (handle != ProcessHandle::none) {
            host_.closeProcess(handle);
        }
    }
    process_ = {};
    stop_.reset();
    standardOutputText_.reset();
    standardErrorText_.reset();
    executed_ = false;
}

}  // namespace kz7
