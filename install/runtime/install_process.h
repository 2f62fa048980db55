// Runs one command for the installer runtime: builds its command line, starts the program hidden with its output
// captured, waits for it, and copies or posts the captured output.
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "install/platform/process_host.h"
#include "install/platform/text.h"
#include "install/platform/threads.h"
#include "install/runtime/create_thread.h"
#include "install/runtime/report_sink.h"

namespace kz7 {

inline constexpr std::size_t kCommandLineSize = 780;          // characters of a command line with its terminator
inline constexpr std::uint32_t kStandardOutputMessage = 997;  // the message with a program's standard output
inline constexpr std::uint32_t kStandardErrorMessage = 999;   // the message with its standard error
inline constexpr std::uint32_t kPostedByProcess = 0x4000000;  // added to the flags of either post

using CommandLine = FixedText<kCommandLineSize>;

// Calling order: construct, `execute(true, false)`, `waitForCompletion` without limit, then the output.
// `execute` exchanges the process-wide standard handles, so no two threads execute at once, and one object
// belongs to one thread. The two readers share the captured texts and the stop flag only.
//
// Callers flush the console before `execute`, so that the program's lines come after theirs, and commit an open store,
// so that the program reads what was written.
class InstallProcess {
public:
    // `command` may be null, which leaves nothing to run; `workingDirectory` null is this process's own.
    // `wrapperMode` runs the command as a statement of the product's command processor, with the first or the
    // second of its option texts by `wrapperSwitch`; the last argument has no effect. The ports and the sink outlive
    // the object. Without memory for the command, `execute` returns kNoMemory.
    InstallProcess(IProcessHost& host, IThreads& threads, IReportSink& sink, const char* command,
                   const char* workingDirectory = nullptr, bool wrapperMode = false, bool wrapperSwitch = false,
                   bool = false);

    // Wakes and joins both readers. A program that still runs is neither killed nor waited for. If a program that has
    // ended left its pipes to a child of its own, this waits until that child ends.
    ~InstallProcess();
    InstallProcess(const InstallProcess&) = delete;
    InstallProcess& operator=(const InstallProcess&) = delete;

    // Starts the program; with `wait`, returns once it has ended or the timeout passed, which is infinite
    // unless an earlier wait set another or an earlier program could not be started. Returns the status of starting the
    // reader of standard error only; the wait reports whether the program ran. An earlier run of the
    // object is given up. kNoMemory: nothing runs.
    Status execute(bool wait, bool trace);

    // Waits for the program and its readers. kNotExecuted; kExitCodeUnavailable: the program could not be
    // started, or its command line was truncated; `exitCode` is then that status too, so that it never reads as a
    // success. After the timeout, in milliseconds, the readers are stopped, and the exit code is what the system
    // returns for a running program.
    Status waitForCompletion(std::uint32_t& exitCode, std::uint32_t timeout);

    // Copies the captured text, truncated to `size` bytes with its terminator. kBufferTooSmall: the
    // text with its terminator does not fit. Captured texts end at their first NUL.
    Status copyStandardOutput(char* buffer, std::size_t size);
    Status copyStandardError(char* buffer, std::size_t size);
    std::size_t standardOutputLength();

    // Post each captured text that is not empty.
    void postOutput(std::string_view source, std::uint32_t flags);
    void postStandardOutput(std::string_view source, std::uint32_t flags);
    void postStandardError(std::string_view source, std::uint32_t flags);

    // Gives the object another command to run. kNoProgramType, kNoMemory: it then has nothing to run.
    Status setCommand(const char* command);

    // The command line of a command, or kNoProgramType and an empty one.
    static Status buildCommandLine(IProcessHost& host, CommandLine& commandLine, std::string_view command);

    std::string_view commandLine() const { return commandLine_.view(); }

    // The message text of the last process that was waited for.
    static std::string_view lastMessage();

private:
    class CollectedText;
    struct Reader;
    using Collected = std::shared_ptr<CollectedText>;

    static Status wholeCommandLine(IProcessHost& host, std::string& commandLine, std::string_view command);
    Status build(const char* command);
    void setCommandLine(std::string_view whole);
    Status run(bool wait);
    Status openPipes(OwnedStream& outputEnd, OwnedStream& errorEnd);
    Status startReader(OwnedStream& readEnd, Collected& text, ThreadRecord& record);
    void waitOrWake();
    void wakeReaders();
    void closeWriteEnds();
    bool joinReader(ThreadRecord& record);
    std::string_view collected(const Collected& text, ThreadRecord& record);
    Status copyOut(const Collected& text, ThreadRecord& record, char* buffer, std::size_t size);
    void post(std::uint32_t number, std::string_view text, std::string_view source, std::uint32_t flags);
    void giveUpRun();

    IProcessHost& host_;
    IThreads& threads_;
    IReportSink& sink_;

    CommandLine commandLine_;
    CommandLine statement_;
    bool commandLineCut_ = false;

protected:
    // If the text is not empty, the wait returns resultCode_ in place of the exit code.
    FixedText<256> messageText_;

private:
    Collected standardErrorText_;
    Collected standardOutputText_;
    bool wrapperSwitch_;

protected:
    std::int32_t resultCode_ = 0;

private:
    ThreadRecord outputReader_;
    ThreadRecord errorReader_;
    OwnedStream errorWriteEnd_;
    OwnedStream outputWriteEnd_;
    std::shared_ptr<std::atomic<bool>> stop_;
    ProcessInformation process_;
    std::uint32_t timeout_ = kInfiniteWait;  // milliseconds
    bool executed_ = false;
    bool wrapperMode_;
    std::string workingDirectory_;  // empty: this process's own
    Status built_ = kSuccess;       // of the command line
};

}  // namespace kz7
