// The process port: child programs with captured output. One operation for each platform call that can fail on its own,
// because the runtime treats the failure of each in its own way.
#pragma once

#include <cstdint>
#include <string_view>

#include "install/platform/buffer.h"
#include "install/platform/owned_handle.h"
#include "install/platform/status.h"

namespace kz7 {

// One end of a pipe, or the value of a standard-handle slot.
enum class StreamHandle : std::uint64_t { none = 0 };

// A started program or its main thread; closeProcess() closes both.
enum class ProcessHandle : std::uint64_t { none = 0 };

// The standard-handle slots of this process. Their values are numbers that may belong to closed handles; console output
// does not use them.
enum class StandardSlot { output, error };

inline constexpr std::uint32_t kInfiniteWait = 0xFFFFFFFF;  // a timeout, in milliseconds
inline constexpr std::uint32_t kExitCodeRunning = 259;      // the exit code of a program that has not ended

struct ProcessStart {
    std::string_view commandLine;       // the program first, in quotes or not
    std::string_view workingDirectory;  // empty: this process's own
    StreamHandle output;
    StreamHandle error;
    StreamHandle input = StreamHandle::none;  // none: an empty standard input
};

// The caller closes both handles; `mainThread` is `none` on hosts without such a handle.
struct ProcessInformation {
    ProcessHandle process = ProcessHandle::none;
    ProcessHandle mainThread = ProcessHandle::none;
    std::uint32_t processId = 0;
    std::uint32_t mainThreadId = 0;
};

// Outputs are written on success only. kInvalidHandle: the null handle or one that is not open. `read`, `write`
// and `closeStream` may be called from any thread, but each stream by one thread at a time; all other operations by one
// thread.
class IProcessHost {
public:
    virtual ~IProcessHost() = default;

    virtual Status getSlot(StandardSlot slot, StreamHandle& stream) = 0;

    // The handle need not be open.
    virtual Status setSlot(StandardSlot slot, StreamHandle stream) = 0;

    // A pipe whose ends a child can inherit. The caller closes both.
    virtual Status createPipe(StreamHandle& readEnd, StreamHandle& writeEnd) = 0;

    // A second handle of a stream, with the same access, that no child inherits. The caller closes it.
    virtual Status duplicate(StreamHandle stream, StreamHandle& copy) = 0;

    // Waits for bytes and returns those that are available, up to the capacity. kBrokenPipe: every write end is
    // closed and all was read. A success with 0 bytes is an empty write at the other end.
    virtual Status read(StreamHandle stream, Buffer& data) = 0;

    // Writes all bytes and waits while the pipe is full. kPipeClosing: the read end is closed or was closed meanwhile.
    virtual Status write(StreamHandle stream, std::string_view data) = 0;

    virtual Status closeStream(StreamHandle stream) = 0;

    // Starts a program without a window, with this process's environment and the streams; it inherits no other handle.
    // A program path with blanks and without quotation marks is tried up to each blank in turn. kFileNotFound: no such
    // program; on POSIX also one that cannot be executed. kBadDirectory: no such working directory.
    virtual Status startProcess(const ProcessStart& start, ProcessInformation& started) = 0;

    // Waits for the end of the program. kWaitTimedOut: it still runs.
    virtual Status waitProcess(ProcessHandle process, std::uint32_t milliseconds) = 0;

    // kExitCodeRunning while it runs; 128 and the signal's number for a program that a signal ended.
    virtual Status exitCode(ProcessHandle process, std::uint32_t& code) = 0;

    // A program that still runs continues, and becomes no zombie when it ends.
    virtual Status closeProcess(ProcessHandle process) = 0;

    // The short form of the path of an existing file, without its NUL. kMoreData: it does not fit with its
    // NUL; kCallNotImplemented: the host has no short paths.
    virtual Status shortPath(std::string_view path, Buffer& shortened) = 0;
};

using OwnedStream = OwnedHandle<PortTraits<IProcessHost, StreamHandle, &IProcessHost::closeStream>>;

}  // namespace kz7
