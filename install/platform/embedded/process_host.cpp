#include "install/platform/embedded/ports.h"

#include <fcntl.h>
#include <poll.h>
#include <pthread.h>
#include <spawn.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/types.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <climits>
#include <csignal>
#include <cstdlib>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "install/platform/command_line.h"
#include "install/platform/embedded/descriptor_table.h"
#include "install/platform/embedded/paths.h"
#include "install/platform/embedded/threads.h"

namespace kz7 {
namespace {

constexpr int kFirstOwnDescriptor = STDERR_FILENO + 1;
constexpr int kPollInterval = 20;     // milliseconds
constexpr int kSignalExitCode = 128;  // a child ended by signal n has the exit code 128 + n
constexpr std::string_view kUsualSearchPath = "/usr/local/bin:/usr/bin:/bin";  // if PATH is not set

Status statusOf(int error) {
    switch (error) {
        case EBADF:
            return kInvalidHandle;
        case EMFILE:
        case ENFILE:
            return kTooManyOpenFiles;
        case ENOMEM:
        case EAGAIN:
            return kOutOfMemory;
        case EPIPE:
            return kPipeClosing;
        default:
            return kGeneralFailure;
    }
}

// Moves a descriptor above the three that become a child's streams; empty on failure.
OwnedDescriptor moveUp(OwnedDescriptor descriptor) {
    return descriptor.get() >= kFirstOwnDescriptor
               ? std::move(descriptor)
               : OwnedDescriptor(fcntl(descriptor.get(), F_DUPFD_CLOEXEC, kFirstOwnDescriptor));
}

// Whether an error number means that this host cannot execute a file.
bool isNoProgram(int error) {
    return error == ENOENT || error == ENOTDIR || error == EACCES || error == ENOEXEC || error == ELOOP ||
           error == ENAMETOOLONG;
}

bool isProgram(const std::string& file) {
    struct stat found {};
    return stat(file.c_str(), &found) == 0 && S_ISREG(found.st_mode) && access(file.c_str(), X_OK) == 0;
}

// The files that a program's name may refer to, in the order of the search.
std::vector<std::string> programFiles(std::string_view program, const std::string& stateDirectory) {
    if (!isBareName(program)) {
        std::string file = hostPath(program, stateDirectory);
        return file.empty() ? std::vector<std::string>{} : std::vector<std::string>{std::move(file)};
    }
    const char* variable = std::getenv("PATH");
    std::string_view rest = variable != nullptr ? std::string_view(variable) : kUsualSearchPath;
    std::vector<std::string> files;
    while (!rest.empty()) {
        const std::string_view folder = rest.substr(0, rest.find(':'));
        rest.remove_prefix(std::min(folder.size() + 1, rest.size()));
        if (!folder.starts_with('/')) {
            continue;
        }
        files.push_back(std::string(folder) + '/' + std::string(program));
        if (program.find('.') == std::string_view::npos) {
            files.push_back(files.back() + ".exe");
        }
    }
    return files;
}

// A write to a pipe without a reader raises SIGPIPE in this thread. The signal is blocked and removed here, so that the
// program's own handling of it does not change.
class WithoutPipeSignal {
public:
    WithoutPipeSignal() {
        sigemptyset(&signal_);
        sigaddset(&signal_, SIGPIPE);
        sigset_t pending;
        sigpending(&pending);
        wasPending_ = sigismember(&pending, SIGPIPE) == 1;
        pthread_sigmask(SIG_BLOCK, &signal_, &before_);
    }
    ~WithoutPipeSignal() {
        const timespec now{};
        while (!wasPending_ && sigtimedwait(&signal_, nullptr, &now) == -1 && errno == EINTR) {
        }
        pthread_sigmask(SIG_SETMASK, &before_, nullptr);
    }
    WithoutPipeSignal(const WithoutPipeSignal&) = delete;
    WithoutPipeSignal& operator=(const WithoutPipeSignal&) = delete;

private:
    sigset_t signal_{};
    sigset_t before_{};
    bool wasPending_ = false;
};

// Signals that a child ignores if this process does: "nohup" and shells that start background programs rely on it. All
// other signals get their default action.
constexpr int kInheritedIgnores[] = {SIGHUP, SIGINT, SIGQUIT};

// The initial state of a child: descriptors 0 to 2 and no others, no signal blocked or caught. Uses posix_spawn(),
// because the cost of fork() grows with the memory in use.
class SpawnPlan {
public:
    SpawnPlan() {
        note(posix_spawn_file_actions_init(&actions_));
        note(posix_spawnattr_init(&attributes_));
    }
    ~SpawnPlan() {
        posix_spawnattr_destroy(&attributes_);
        posix_spawn_file_actions_destroy(&actions_);
    }
    SpawnPlan(const SpawnPlan&) = delete;
    SpawnPlan& operator=(const SpawnPlan&) = delete;

    void openNull(int target, int mode) {
        note(posix_spawn_file_actions_addopen(&actions_, target, "/dev/null", mode, 0));
    }
    void give(int descriptor, int target) { note(posix_spawn_file_actions_adddup2(&actions_, descriptor, target)); }

    // An error number, or 0 for a child that executes the file.
    int run(pid_t& id, const char* file, const std::string& directory, char* const* argv) {
        // One system call for any limit of open files.
        note(posix_spawn_file_actions_addclosefrom_np(&actions_, kFirstOwnDescriptor));
        if (!directory.empty()) {
            note(posix_spawn_file_actions_addchdir_np(&actions_, directory.c_str()));
        }
        sigset_t signals;
        sigemptyset(&signals);
        note(posix_spawnattr_setsigmask(&attributes_, &signals));
        sigfillset(&signals);
        for (const int signal : kInheritedIgnores) {
            struct sigaction action {};
            if (sigaction(signal, nullptr, &action) == 0 && action.sa_handler == SIG_IGN) {
                sigdelset(&signals, signal);
            }
        }
        note(posix_spawnattr_setsigdefault(&attributes_, &signals));
        note(posix_spawnattr_setflags(&attributes_, POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF));
        return error_ != 0 ? error_ : posix_spawn(&id, file, &actions_, &attributes_, argv, environ);
    }

private:
    void note(int error) {
        if (error_ == 0) {
            error_ = error;
        }
    }

    posix_spawn_file_actions_t actions_{};
    posix_spawnattr_t attributes_{};
    int error_ = 0;
};

// waitpid() that continues after a signal.
pid_t waitForChild(pid_t id, int* ending, int options) {
    pid_t found = -1;
    do {
        found = waitpid(id, ending, options);
    } while (found == -1 && errno == EINTR);
    return found;
}

bool hasEnded(pid_t id) {
    siginfo_t ended{};
    return waitid(P_PID, static_cast<id_t>(id), &ended, WEXITED | WNOHANG | WNOWAIT) == -1 || ended.si_pid != 0;
}

// Waits until a child has ended or the time is over. The exit code can still be collected.
void waitWithin(pid_t id, std::uint32_t milliseconds) {
    using Clock = std::chrono::steady_clock;
    const auto deadline = Clock::now() + std::chrono::milliseconds(milliseconds);
    const OwnedDescriptor child(static_cast<int>(syscall(SYS_pidfd_open, id, 0)));
    // Without a free descriptor or a kernel that supports the call, polls the child at short intervals.
    const std::int64_t longest = child ? INT_MAX : kPollInterval;
    pollfd watched{child.get(), POLLIN, 0};  // poll() ignores -1
    while (!hasEnded(id) && Clock::now() < deadline) {
        const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - Clock::now()).count();
        poll(&watched, 1, static_cast<int>(std::clamp<std::int64_t>(left, 0, longest)));
    }
}

// Collects the exit code of a child that nobody waits for, so that it does not remain a zombie. A separate thread waits
// for a child that still runs; it ends with the child or with this process.
void collectLater(pid_t id) {
    const auto collect = [](void* child) -> void* {
        waitForChild(static_cast<pid_t>(reinterpret_cast<std::intptr_t>(child)), nullptr, 0);
        return nullptr;
    };
    pthread_attr_t attributes;
    if (makeThreadAttributes(1, attributes) != 0) {
        return;
    }
    pthread_attr_setdetachstate(&attributes, PTHREAD_CREATE_DETACHED);
    pthread_t thread{};
    // The argument is the number itself: this also runs without memory.
    // NOLINTNEXTLINE(performance-no-int-to-ptr)
    pthread_create(&thread, &attributes, collect, reinterpret_cast<void*>(static_cast<std::intptr_t>(id)));
    pthread_attr_destroy(&attributes);
}

// The process port on POSIX. Handles and the values of the standard-handle slots are tokens of this object, never
// descriptors.
class EmbeddedProcessHost final : public IProcessHost {
public:
    explicit EmbeddedProcessHost(std::string stateDirectory)
        : stateDirectory_(std::move(stateDirectory)), slots_{StreamHandle{1}, StreamHandle{2}}, streams_(2) {}

    Status getSlot(StandardSlot slot, StreamHandle& stream) override {
        stream = slots_[static_cast<std::size_t>(slot)];
        return kSuccess;
    }

    Status setSlot(StandardSlot slot, StreamHandle stream) override {
        slots_[static_cast<std::size_t>(slot)] = stream;
        return kSuccess;
    }

    Status createPipe(StreamHandle& readEnd, StreamHandle& writeEnd) override {
        // A child gets its ends explicitly: no descriptor of this process survives an exec.
        int ends[2];
        if (pipe2(ends, O_CLOEXEC) == -1) {
            return statusOf(errno);
        }
        OwnedDescriptor lowReading(ends[0]);
        OwnedDescriptor lowWriting(ends[1]);
        OwnedDescriptor reading = moveUp(std::move(lowReading));
        OwnedDescriptor writing = moveUp(std::move(lowWriting));
        if (!reading || !writing) {
            return statusOf(errno);
        }
        readEnd = streams_.give(std::move(reading));
        writeEnd = streams_.give(std::move(writing));
        return kSuccess;
    }

    Status duplicate(StreamHandle stream, StreamHandle& copy) override {
        OwnedDescriptor descriptor(fcntl(streams_.find(stream), F_DUPFD_CLOEXEC, kFirstOwnDescriptor));
        if (!descriptor) {
            return statusOf(errno);
        }
        copy = streams_.give(std::move(descriptor));
        return kSuccess;
    }

    Status read(StreamHandle stream, Buffer& data) override {
        const int descriptor = streams_.find(stream);
        ssize_t count = -1;
        do {
            count = ::read(descriptor, data.data, data.capacity);
        } while (count == -1 && errno == EINTR);
        if (count == -1) {
            return statusOf(errno);
        }
        data.size = static_cast<std::uint32_t>(count);
        return count == 0 && data.capacity != 0 ? kBrokenPipe : kSuccess;
    }

    Status write(StreamHandle stream, std::string_view data) override {
        const WithoutPipeSignal guard;
        return writeAll(streams_.find(stream), data).empty() ? kSuccess : statusOf(errno);
    }

    Status closeStream(StreamHandle stream) override { return streams_.take(stream) ? kSuccess : kInvalidHandle; }

    Status startProcess(const ProcessStart& start, ProcessInformation& started) override {
        for (const CommandReading& reading : commandReadings(start.commandLine)) {
            for (const std::string& file : programFiles(reading.program, stateDirectory_)) {
                if (!isProgram(file)) {
                    continue;
                }
                const Status status = spawn(file, reading.program, reading.arguments, start, started);
                if (!isNotFound(status)) {
                    return status;
                }
            }
        }
        return kFileNotFound;
    }

    Status waitProcess(ProcessHandle process, std::uint32_t milliseconds) override {
        Child* child = children_.find(process);
        if (child == nullptr) {
            return kInvalidHandle;
        }
        if (milliseconds == kInfiniteWait) {
            return takeEnding(*child, 0);
        }
        if (!child->ended && milliseconds != 0) {
            waitWithin(child->id, milliseconds);
        }
        return takeEnding(*child, WNOHANG);
    }

    Status exitCode(ProcessHandle process, std::uint32_t& code) override {
        Child* child = children_.find(process);
        if (child == nullptr) {
            return kInvalidHandle;
        }
        const Status status = takeEnding(*child, WNOHANG);
        if (status != kSuccess && status != kWaitTimedOut) {
            return status;
        }
        code = child->exitCode;
        return kSuccess;
    }

    Status closeProcess(ProcessHandle process) override {
        Child* child = children_.find(process);
        if (child == nullptr) {
            return kInvalidHandle;
        }
        if (takeEnding(*child, WNOHANG) == kWaitTimedOut) {
            collectLater(child->id);
        }
        children_.close(process);
        return kSuccess;
    }

    Status shortPath(std::string_view, Buffer&) override { return kCallNotImplemented; }

private:
    struct Child {
        pid_t id = 0;
        bool ended = false;
        std::uint32_t exitCode = kExitCodeRunning;
    };

    Status takeEnding(Child& child, int options) {
        if (child.ended) {
            return kSuccess;
        }
        int ending = 0;
        const pid_t found = waitForChild(child.id, &ending, options);
        if (found == 0) {
            return kWaitTimedOut;
        }
        if (found == -1) {
            return statusOf(errno);
        }
        child.ended = true;
        child.exitCode =
            static_cast<std::uint32_t>(WIFSIGNALED(ending) ? kSignalExitCode + WTERMSIG(ending) : WEXITSTATUS(ending));
        return kSuccess;
    }

    Status spawn(const std::string& file, std::string_view program, std::string_view arguments,
                 const ProcessStart& start, ProcessInformation& started) {
        std::string directory;
        if (!start.workingDirectory.empty()) {
            directory = hostPath(start.workingDirectory, stateDirectory_);
            struct stat found {};
            if (directory.empty() || stat(directory.c_str(), &found) == -1 || !S_ISDIR(found.st_mode)) {
                return kBadDirectory;
            }
        }
        std::vector<std::string> words = splitArguments(arguments);
        words.insert(words.begin(), std::string(program));
        std::vector<char*> argv;
        argv.reserve(words.size() + 1);
        for (std::string& word : words) {
            argv.push_back(word.data());
        }
        argv.push_back(nullptr);

        SpawnPlan plan;
        for (const auto& [stream, target] :
             {std::pair{start.input, STDIN_FILENO}, {start.output, STDOUT_FILENO}, {start.error, STDERR_FILENO}}) {
            if (stream == StreamHandle::none) {
                plan.openNull(target, target == STDIN_FILENO ? O_RDONLY : O_WRONLY);
            } else {
                plan.give(streams_.find(stream), target);
            }
        }
        // The entry is made first, so that no running child is without one.
        const ProcessHandle process = children_.give({});
        Child& child = *children_.find(process);
        const int error = plan.run(child.id, file.c_str(), directory, argv.data());
        if (error != 0) {
            children_.close(process);
            return isNoProgram(error) ? kFileNotFound : statusOf(error);
        }
        const auto id = static_cast<std::uint32_t>(child.id);
        started = {process, ProcessHandle::none, id, id};
        return kSuccess;
    }

    std::string stateDirectory_;
    std::array<StreamHandle, 2> slots_;
    DescriptorTable<StreamHandle> streams_;
    HandleTable<ProcessHandle, Child> children_;
};

}  // namespace

std::unique_ptr<IProcessHost> embeddedProcesses(std::string stateDirectory) {
    return std::make_unique<EmbeddedProcessHost>(std::move(stateDirectory));
}

void settleInheritedState() {
    // If SIGCHLD is ignored, exit codes of children are lost.
    std::signal(SIGCHLD, SIG_DFL);
    // open() returns the lowest free number, which is the missing one. A write to a stream that was closed must fail.
    int opened = 0;
    do {
        opened = open("/dev/null", O_RDONLY);
    } while (opened != -1 && opened < STDERR_FILENO);
    if (opened > STDERR_FILENO) {
        close(opened);
    }
}

}  // namespace kz7
