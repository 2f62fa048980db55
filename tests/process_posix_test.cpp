// What running programs means on POSIX: where programs are found, how a child begins and ends, and that
// nothing is left over.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <functional>
#include <optional>
#include <tuple>

#include "install/platform/embedded/process_host.h"
#include "install/platform/embedded/threads.h"
#include "install/runtime/install_process.h"
#include "tests/support/backends.h"
#include "tests/support/gate.h"
#include "tests/support/run_program.h"

namespace kz7::test {
namespace {

namespace fs = std::filesystem;

std::size_t entries(const char* folder) {
    return static_cast<std::size_t>(std::distance(fs::directory_iterator(folder), {}));
}

void writeFile(const fs::path& path, const std::string& text, mode_t mode) {
    fs::create_directories(path.parent_path());
    overwrite(path, text);
    chmod(path.c_str(), mode);
}

// Runs the body in a child of its own, whose descriptors, signals and folder it may spoil; true when it holds there.
bool holdsInFork(const std::function<bool()>& body) {
    std::fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        const bool holds = body() && !testing::Test::HasFailure();
        std::fflush(nullptr);
        _exit(holds ? 0 : 1);
    }
    int ending = 0;
    waitpid(child, &ending, 0);
    return ending == 0;
}

using Outcome = std::tuple<Status, std::uint32_t, std::string>;  // of the wait, the exit code and the output

Outcome outcomeOf(IProcessHost& host, const std::string& command, const char* directory = nullptr) {
    EmbeddedThreads threads;
    QuietSink sink;
    InstallProcess process(host, threads, sink, command.c_str(), directory);
    process.execute(true, false);
    std::uint32_t code = 0;
    const Status status = process.waitForCompletion(code, kInfiniteWait);
    std::string output(process.standardOutputLength() + 1, '\0');
    process.copyStandardOutput(output.data(), output.size());
    output.pop_back();
    return {status, code, output};
}

Outcome childOutcome(const std::string& arguments) {
    EmbeddedProcessHost host("/nonexistent");
    return outcomeOf(host, childProgram() + " " + arguments);
}

TEST(PosixProcess, FindsProgramsWhereTheProductAndTheHostKeepThem) {
    const TemporaryDirectory folder;
    const std::string root = folder.path();
    const std::string script = "#!/bin/sh\nprintf '[%s]' \"$@\"\n";
    writeFile(root + "/drive_c/Program Files/x/run.cmd", script, 0755);
    writeFile(root + "/drive_c/Program", "in the way, but no program", 0755);
    writeFile(root + "/drive_c/t.exe", script, 0755);
    writeFile(root + "/drive_c/text.exe", "no program\n", 0755);
    writeFile(root + "/drive_c/lost.exe", "#!/no/such/interpreter\n", 0755);
    writeFile(root + "/drive_c/folder.exe/t", script, 0755);
    writeFile(root + "/drive_c/plain.exe", script, 0644);
    writeFile(root + "/path/bare", script, 0755);
    writeFile(root + "/path/added.exe", script, 0755);
    writeFile(root + "/here/stray", script, 0755);
    // clang-format off
    const struct { std::string commandLine; const char* output; const char* why; } rows[] = {
        {R"("C:\Program Files\x\run.cmd" a "b c")", "[a][b c]", "a path in quotes"},
        {R"(C:\Program Files\x\run.cmd a "b c")",   "[a][b c]", "without quotes, found piece by piece; what is no program is passed over"},
        {"c:/t.exe\ta  b",                          "[a][b]",   "a small drive letter, slashes, any blanks"},
        {root + "/drive_c/t.exe a",                 "[a]",      "a path of the host"},
        {"bare a",                                  "[a]",      "a bare name on the search path"},
        {"added a",                                 "[a]",      "a bare name without its ending"},
        {"stray a",                                 nullptr,    "a search path that hangs on the current folder"},
        {"here\\stray a",                           nullptr,    "a relative path with a folder"},
        {"C:t.exe a",                               nullptr,    "a path that hangs on a drive's current folder"},
        {"D:\\t.exe a",                             nullptr,    "another drive"},
        {"C:\\..\\drive_c\\t.exe a",                nullptr,    "out of the drive"},
        {"C:\\text.exe a",                          nullptr,    "what the kernel cannot execute"},
        {"C:\\lost.exe a",                          nullptr,    "a script without its interpreter"},
        {"C:\\folder.exe a",                        nullptr,    "a folder"},
        {"C:\\plain.exe a",                         nullptr,    "a file that may not be executed"},
    };
    // clang-format on
    EXPECT_TRUE(holdsInFork([&] {
        setenv("PATH", ("here:.::" + root + "/path").c_str(), 1);
        fs::current_path(root);
        EmbeddedProcessHost host(root);
        for (const auto& row : rows) {
            ProcessInformation child;
            if (row.output != nullptr) {
                EXPECT_EQ(outcomeOf(host, row.commandLine), (Outcome{kSuccess, 0, row.output})) << row.why;
            } else {
                const ProcessStart start{row.commandLine, {}, StreamHandle::none, StreamHandle::none};
                EXPECT_EQ(host.startProcess(start, child), kFileNotFound) << row.why;
            }
        }
        return true;
    }));

    EmbeddedProcessHost host(root);
    EXPECT_EQ(outcomeOf(host, "/bin/pwd", "C:\\Program Files"),
              (Outcome{kSuccess, 0, root + "/drive_c/Program Files\n"}));
    const Outcome none{kExitCodeUnavailable, kExitCodeUnavailable, ""};
    EXPECT_EQ(outcomeOf(host, "/bin/pwd", "C:\\nowhere"), none);
    EXPECT_EQ(outcomeOf(host, "/bin/pwd", "drive_c"), none) << "a relative folder is none";
}

TEST(PosixProcess, AChildBeginsCleanWhateverItsParentHas) {
    EXPECT_TRUE(holdsInFork([] {
        std::signal(SIGPIPE, SIG_IGN);
        std::signal(SIGTERM, SIG_IGN);
        sigset_t all;
        sigfillset(&all);
        sigprocmask(SIG_BLOCK, &all, nullptr);
        open("/etc/passwd", O_RDONLY);
        dup2(1, 900);
        EmbeddedProcessHost host("/nonexistent");
        EXPECT_EQ(outcomeOf(host, "/bin/ls /proc/self/fd"), (Outcome{kSuccess, 0, "0\n1\n2\n3\n"})) << "3 is its own";
        // All but the two that the C library keeps for itself.
        const std::string none = "\"Sig(Blk|Ign):.0{7}[01][08]0{7}$\"";
        EXPECT_EQ(outcomeOf(host, "/bin/grep -cE " + none + " /proc/self/status"), (Outcome{kSuccess, 0, "2\n"}));
        return true;
    }));
}

TEST(PosixProcess, ASignalIsAnExitCode) {
    EmbeddedProcessHost host("/nonexistent");
    for (const std::uint32_t signal : {SIGTERM, SIGKILL, SIGSEGV, SIGPIPE, SIGHUP}) {
        EXPECT_EQ(outcomeOf(host, "/bin/sh -c \"kill -" + std::to_string(signal) + " $$\""),
                  (Outcome{kSuccess, 128U + signal, ""}));
    }
}

TEST(PosixProcess, TheProgramsOwnOutputStaysWhereItWent) {
    const TemporaryDirectory folder;
    const std::string output = folder.path() + "/output";
    EXPECT_TRUE(holdsInFork([&] {
        const bool redirected = std::freopen(output.c_str(), "w", stdout) != nullptr;
        for (int run = 0; run < 4; ++run) {
            std::printf("before %d\n", run);
            childOutcome(run == 2 ? "nothing" : "print said cried 0");
            // What is opened now may have a number that a slot still holds in another form.
            open("/etc/passwd", O_RDONLY | O_CLOEXEC);
        }
        return redirected;
    }));
    EXPECT_EQ(contents(output), "before 0\nbefore 1\nbefore 2\nbefore 3\n");
}

TEST(PosixProcess, RunsWithStandardDescriptorsClosedOrChildrenIgnored) {
    for (int closed = 0; closed < 8; ++closed) {
        for (const bool settled : {true, false}) {
            EXPECT_TRUE(holdsInFork([closed, settled] {
                for (int descriptor = 0; descriptor < 3; ++descriptor) {
                    if ((closed & (1 << descriptor)) != 0) {
                        close(descriptor);
                    }
                }
                if (settled) {
                    std::signal(SIGCHLD, SIG_IGN);
                    settleInheritedState();
                }
                const Outcome first = childOutcome("print said cried 5");
                const bool open = fcntl(0, F_GETFD) != -1 && fcntl(1, F_GETFD) != -1 && fcntl(2, F_GETFD) != -1;
                return first == Outcome{kSuccess, 5, "said"} && first == childOutcome("print said cried 5") &&
                       (open || !settled);
            })) << closed;
        }
    }
}

// A thread that was joined, and a child that just ended, leave the tables of the kernel a moment later.
bool eventually(const std::function<bool()>& holds) {
    for (int i = 0; i < 10'000'000 && !holds(); ++i) {
        sched_yield();
    }
    return holds();
}

TEST(PosixProcess, LeavesNoDescriptorThreadOrZombie) {
    const auto noChildren = [] {
        siginfo_t ended{};
        return waitid(P_ALL, 0, &ended, WEXITED | WNOHANG | WNOWAIT) == -1 && errno == ECHILD;
    };
    ASSERT_TRUE(eventually(noChildren));
    const std::size_t descriptors = entries("/proc/self/fd");
    const std::size_t threads = entries("/proc/self/task");

    EmbeddedProcessHost host("/nonexistent");
    EmbeddedThreads readers;
    QuietSink sink;
    Gate gate;
    Gate left;
    Gate later;
    // clang-format off
    const struct {
        std::string arguments; std::optional<std::uint32_t> timeout; Gate* before; Gate* after; const char* why;
    } rows[] = {
        {" print a b 0",                kInfiniteWait, nullptr, nullptr, "a whole run"},
        {"-missing.exe",                kInfiniteWait, nullptr, nullptr, "it never starts"},
        {" flood 0 0",                  1,             nullptr, nullptr, "a timeout while it floods"},
        {" leave " + left.name(),       kInfiniteWait, &left,   nullptr, "another holds its pipes"},
        {" gate " + gate.name() + " 0", 0,             nullptr, &gate,   "it ends after the object"},
        {" gate " + later.name() + " 0", std::nullopt, nullptr, &later,  "the same, never waited for"},
    };
    // clang-format on
    for (const auto& row : rows) {
        {
            InstallProcess process(host, readers, sink, (childProgram() + row.arguments).c_str());
            process.execute(false, false);
            if (row.before != nullptr) {
                row.before->open();
            }
            if (std::uint32_t code = 0; row.timeout) {
                process.waitForCompletion(code, *row.timeout);
            }
        }
        EXPECT_EQ(entries("/proc/self/fd"), descriptors) << row.why;
        if (row.after != nullptr) {
            row.after->open();
        }
        EXPECT_TRUE(eventually(noChildren)) << row.why;
        EXPECT_TRUE(eventually([&] { return entries("/proc/self/task") == threads; })) << row.why;
    }
}

}  // namespace
}  // namespace kz7::test
