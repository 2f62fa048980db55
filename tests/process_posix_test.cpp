// Child programs on POSIX: where they are found, what they inherit, how they end, and that nothing leaks.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <functional>
#include <optional>
#include <thread>

#include "install/platform/embedded/ports.h"
#include "tests/support/backends.h"
#include "tests/support/captured_run.h"
#include "tests/support/gate.h"
#include "tests/support/run_program.h"

namespace kz7::test {
namespace {

namespace fs = std::filesystem;

std::size_t entries(const char* folder) {
    return static_cast<std::size_t>(std::distance(fs::directory_iterator(folder), {}));
}

// Runs the body in a child process, because it changes descriptors, signals and the current directory.
void inFork(const std::function<void()>& body) {
    std::fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        body();
        std::fflush(nullptr);
        _exit(testing::Test::HasFailure() ? 1 : 0);
    }
    int ended = 0;
    waitpid(child, &ended, 0);
    EXPECT_EQ(ended, 0);
}

class PosixProcess : public testing::Test {
protected:
    // The results of a command as one text.
    std::string outcome(const std::string& command, const char* directory = nullptr) {
        ListedSink sink;
        InstallProcess process(*host_, *threads_, sink, command.c_str(), directory);
        process.execute(true, false);
        return ending(process, sink);
    }

    TemporaryDirectory folder_;
    const std::string& root_ = folder_.path();
    std::unique_ptr<IProcessHost> host_ = embeddedProcesses(root_);
    std::unique_ptr<IThreads> threads_ = embeddedThreads();
};

TEST_F(PosixProcess, FindsProgramsOfTheProductAndTheHost) {
    const std::string script = "#!/bin/sh\nprintf '[%s]' \"$@\"\n";
    const std::pair<std::string, std::string> files[] = {{"drive_c/Program Files/x/run.cmd", script},
                                                         {"drive_c/Program", "in the way, but no program"},
                                                         {"drive_c/t.exe", script},
                                                         {"drive_c/lost.exe", "#!/no/such/interpreter\n"},
                                                         {"drive_c/plain.exe", script},
                                                         {"path/bare", script},
                                                         {"path/added.exe", script},
                                                         {"here/stray", script}};
    for (const auto& [name, text] : files) {
        const fs::path path = fs::path(root_) / name;
        fs::create_directories(path.parent_path());
        overwrite(path, text);
        chmod(path.c_str(), name == "drive_c/plain.exe" ? 0644 : 0755);
    }
    // clang-format off
    const struct { std::string commandLine; const char* output; const char* why; } rows[] = {
        {R"("C:\Program Files\x\run.cmd" a "b c")", "[a][b c]", "a path in quotes"},
        {R"(C:\Program Files\x\run.cmd a "b c")",   "[a][b c]", "without quotes, tried word by word; files that are not programs are skipped"},
        {"c:/t.exe\ta  b",                          "[a][b]",   "a small drive letter, slashes, any blanks"},
        {root_ + "/drive_c/t.exe a",                "[a]",      "a path of the host"},
        {"bare a",                                  "[a]",      "a bare name on the search path"},
        {"added a",                                 "[a]",      "a bare name without its extension"},
        {"stray a",                                 nullptr,    "a search path that depends on the current directory"},
        {"C:t.exe a",                               nullptr,    "a path that depends on a drive's current directory"},
        {"C:\\..\\drive_c\\t.exe a",                nullptr,    "out of the drive"},
        {"C:\\Program a",                           nullptr,    "what the kernel cannot execute"},
        {"C:\\lost.exe a",                          nullptr,    "a script whose interpreter is missing"},
        {"C:\\plain.exe a",                         nullptr,    "a file that may not be executed"},
    };
    // clang-format on
    inFork([&] {
        setenv("PATH", ("here:.::" + root_ + "/path").c_str(), 1);
        fs::current_path(root_);
        for (const auto& row : rows) {
            ProcessInformation child;
            if (row.output != nullptr) {
                EXPECT_EQ(outcome(row.commandLine), std::string("0 0 ") + row.output) << row.why;
            } else {
                const ProcessStart start{row.commandLine, {}, StreamHandle::none, StreamHandle::none};
                EXPECT_EQ(host_->startProcess(start, child), kFileNotFound) << row.why;
            }
        }
    });
    EXPECT_EQ(outcome("/bin/pwd", "C:\\Program Files"), "0 0 " + root_ + "/drive_c/Program Files\n");
    EXPECT_EQ(outcome("/bin/pwd", "C:\\nowhere"), "5082 5082 ");
    EXPECT_EQ(outcome("/bin/pwd", "drive_c"), "5082 5082 ") << "a relative directory";
    EXPECT_EQ(outcome("/bin/sh -c \"kill -TERM $$\""), "0 143 ") << "a signal is an exit code";
}

TEST_F(PosixProcess, AChildInheritsNoDescriptorsOrSignals) {
    inFork([&] {
        std::signal(SIGPIPE, SIG_IGN);
        std::signal(SIGTERM, SIG_IGN);
        std::signal(SIGHUP, SIG_IGN);
        sigset_t all;
        sigfillset(&all);
        sigprocmask(SIG_BLOCK, &all, nullptr);
        open("/etc/passwd", O_RDONLY);
        dup2(1, 900);
        EXPECT_EQ(outcome("/bin/ls /proc/self/fd"), "0 0 0\n1\n2\n3\n") << "3 is its own";
        // SIGHUP stays ignored; the C library keeps two signals for itself.
        const std::string clean = "\"Sig(Blk:.0{7}[01][08]0{7}|Ign:.0{7}[01][08]0{6}1)$\"";
        EXPECT_EQ(outcome("/bin/grep -cE " + clean + " /proc/self/status"), "0 0 2\n");
    });
}

TEST_F(PosixProcess, WaitsWithALimitWhenNoDescriptorIsFree) {
    inFork([&] {
        ProcessInformation child;
        ASSERT_EQ(host_->startProcess({"/bin/sleep 0.2", {}, StreamHandle::none, StreamHandle::none}, child), kSuccess);
        const rlimit full{3, 3};
        setrlimit(RLIMIT_NOFILE, &full);
        EXPECT_EQ(host_->waitProcess(child.process, 1), kWaitTimedOut);
        EXPECT_EQ(host_->waitProcess(child.process, 60'000), kSuccess);
    });
}

TEST_F(PosixProcess, RunsWithStandardDescriptorsClosedOrChildrenIgnored) {
    for (int closed = 0; closed < 16; ++closed) {
        SCOPED_TRACE(closed);
        const bool settled = closed >= 8;
        inFork([&] {
            for (int descriptor = 0; descriptor < 3; ++descriptor) {
                if ((closed & (1 << descriptor)) != 0) {
                    close(descriptor);
                }
            }
            if (settled) {
                std::signal(SIGCHLD, SIG_IGN);
                settleInheritedState();
            }
            for (int run = 0; run < 2; ++run) {
                EXPECT_EQ(outcome(childProgram() + " print said cried 5"), "0 5 said|cried");
            }
            for (int descriptor = 0; descriptor < 3 && settled; ++descriptor) {
                EXPECT_NE(fcntl(descriptor, F_GETFD), -1) << descriptor;
            }
        });
    }
}

TEST_F(PosixProcess, LeavesNoDescriptorThreadOrZombie) {
    const auto noChildren = [] {
        siginfo_t ended{};
        return waitid(P_ALL, 0, &ended, WEXITED | WNOHANG | WNOWAIT) == -1 && errno == ECHILD;
    };
    ASSERT_TRUE(eventually(noChildren));
    std::thread([] {}).join();  // with the first thread the library of a sanitizer starts one of its own
    const std::size_t descriptors = entries("/proc/self/fd");
    const std::size_t threads = entries("/proc/self/task");
    QuietSink sink;
    Gate gate;
    // clang-format off
    const struct { std::string arguments; std::optional<std::uint32_t> timeout; const char* why; } rows[] = {
        {" print a b 0",                kInfiniteWait, "a whole run"},
        {"-missing.exe",                kInfiniteWait, "it never starts"},
        {" flood 0 0",                  1,             "a timeout while it floods"},
        {" leave " + gate.name(),       kInfiniteWait, "another holds its pipes"},
        {" gate " + gate.name() + " 0", std::nullopt,  "the same, never waited for"},
    };
    // clang-format on
    for (const auto& row : rows) {
        const bool gated = row.arguments.find(gate.name()) != std::string::npos;
        {
            InstallProcess process(*host_, *threads_, sink, (childProgram() + row.arguments).c_str());
            process.execute(false, false);
            if (gated && row.timeout == kInfiniteWait) {
                gate.open();
            }
            if (std::uint32_t code = 0; row.timeout) {
                process.waitForCompletion(code, *row.timeout);
            }
        }
        EXPECT_EQ(entries("/proc/self/fd"), descriptors) << row.why;
        if (gated && row.timeout != kInfiniteWait) {
            gate.open();
        }
        EXPECT_TRUE(eventually(noChildren)) << row.why;
        EXPECT_TRUE(eventually([&] { return entries("/proc/self/task") == threads; })) << row.why;
    }
}

}  // namespace
}  // namespace kz7::test
