// What running programs means on POSIX: where programs are found, how a child begins and ends, and that
// nothing is left over.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <fstream>
#include <functional>

#include "install/platform/embedded/process_host.h"
#include "install/platform/embedded/threads.h"
#include "install/runtime/install_process.h"
#include "tests/support/gate.h"
#include "tests/support/host_processes.h"
#include "tests/support/run_program.h"

namespace kz7::test {
namespace {

namespace fs = std::filesystem;

std::size_t entries(const char* folder) {
    return static_cast<std::size_t>(std::distance(fs::directory_iterator(folder), {}));
}

void writeFile(const fs::path& path, const std::string& text, mode_t mode) {
    fs::create_directories(path.parent_path());
    std::ofstream(path) << text;
    chmod(path.c_str(), mode);
}

// Runs the body in a child of its own, whose descriptors and signals it may spoil; its exit code is 0 when the
// body holds.
int inFork(const std::function<bool()>& body) {
    std::fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        _exit(body() ? 0 : 1);
    }
    int ending = 0;
    waitpid(child, &ending, 0);
    return ending;
}

struct Outcome {
    Status status = kSuccess;  // of the wait
    std::uint32_t code = 0;
    std::string output;

    bool operator==(const Outcome&) const = default;
    friend std::ostream& operator<<(std::ostream& out, const Outcome& shown) {
        return out << shown.status << ", exit code " << shown.code << ", " << shown.output;
    }
};

Outcome outcomeOf(IProcessHost& host, const std::string& command, const char* directory = nullptr) {
    EmbeddedThreads threads;
    QuietSink sink;
    InstallProcess process(host, threads, sink, command.c_str(), directory);
    process.execute(true, false);
    Outcome outcome;
    outcome.status = process.waitForCompletion(outcome.code, kInfiniteWait);
    outcome.output.resize(process.standardOutputLength() + 1);
    process.copyStandardOutput(outcome.output.data(), outcome.output.size());
    outcome.output.pop_back();
    return outcome;
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
    std::string backslashed = root + "/drive_c/t.exe";
    std::replace(backslashed.begin(), backslashed.end(), '/', '\\');
    // clang-format off
    const struct { std::string commandLine; Status status; const char* output; const char* why; } rows[] = {
        {R"("C:\Program Files\x\run.cmd" a "b c")", kSuccess, "[a][b c]", "a path in quotes"},
        {R"(C:\Program Files\x\run.cmd a "b c")",   kSuccess, "[a][b c]", "without quotes, found piece by piece; what is no program is passed over"},
        {"c:/t.exe\ta  b",                          kSuccess, "[a][b]",   "a small drive letter, slashes, any blanks"},
        {root + "/drive_c/t.exe a",                 kSuccess, "[a]",      "a path of the host"},
        {backslashed + " a",                        kSuccess, "[a]",      "the same in backslashes"},
        {"bare a",                                  kSuccess, "[a]",      "a bare name on the search path"},
        {"added a",                                 kSuccess, "[a]",      "a bare name without its ending"},
        {"stray a",                                 kFileNotFound, "",    "a search path that hangs on the current folder"},
        {"here\\stray a",                           kFileNotFound, "",    "a relative path with a folder"},
        {"C:t.exe a",                               kFileNotFound, "",    "a path that hangs on a drive's current folder"},
        {"D:\\t.exe a",                             kFileNotFound, "",    "another drive"},
        {"C:\\..\\drive_c\\t.exe a",                kFileNotFound, "",    "out of the drive"},
        {"C:\\text.exe a",                          kFileNotFound, "",    "what the kernel cannot execute"},
        {"C:\\lost.exe a",                          kFileNotFound, "",    "a script without its interpreter"},
        {"C:\\folder.exe a",                        kFileNotFound, "",    "a folder"},
        {"C:\\plain.exe a",                         kFileNotFound, "",    "a file that may not be executed"},
    };
    // clang-format on
    const std::string searchPath = std::getenv("PATH");
    setenv("PATH", ("here:.::" + root + "/path").c_str(), 1);
    const fs::path before = fs::current_path();
    fs::current_path(root);
    EmbeddedProcessHost host(root);
    for (const auto& row : rows) {
        OwnedStream output(host);
        OwnedStream end(host);
        ASSERT_EQ(host.createPipe(output.receive(), end.receive()), kSuccess);
        ProcessInformation child;
        EXPECT_EQ(host.startProcess({row.commandLine, {}, end.get(), StreamHandle::none}, child), row.status)
            << row.why;
        host.waitProcess(child.process, kInfiniteWait);
        host.closeProcess(child.process);
        end.reset();
        FixedBuffer<100> text;
        host.read(output.get(), text);
        EXPECT_EQ(text.view(), row.output) << row.why;
    }
    setenv("PATH", searchPath.c_str(), 1);
    fs::current_path(before);

    EXPECT_EQ(outcomeOf(host, R"(C:\Program Files\x\run.cmd here)"), (Outcome{kSuccess, 0, "[here]"}));
    EXPECT_EQ(outcomeOf(host, "/bin/pwd", "C:\\Program Files"),
              (Outcome{kSuccess, 0, root + "/drive_c/Program Files\n"}));
    EXPECT_EQ(outcomeOf(host, "/bin/pwd", "C:\\nowhere").status, kExitCodeUnavailable);
    EXPECT_EQ(outcomeOf(host, "/bin/pwd", "drive_c").status, kExitCodeUnavailable) << "a relative folder is none";
}

TEST(PosixProcess, AChildBeginsCleanWhateverItsParentHas) {
    EXPECT_EQ(inFork([] {
                  std::signal(SIGPIPE, SIG_IGN);
                  std::signal(SIGTERM, SIG_IGN);
                  sigset_t all;
                  sigfillset(&all);
                  sigprocmask(SIG_BLOCK, &all, nullptr);
                  open("/etc/passwd", O_RDONLY);
                  dup2(1, 900);
                  return childOutcome("inherited") == Outcome{kSuccess, 0, "0 /dev/null\n1 pipe\n2 pipe\n"};
              }),
              0);
}

TEST(PosixProcess, ASignalIsAnExitCode) {
    for (const int signal : {SIGTERM, SIGKILL, SIGSEGV, SIGPIPE, SIGHUP}) {
        EXPECT_EQ(childOutcome("die " + std::to_string(signal)),
                  (Outcome{kSuccess, 128U + static_cast<std::uint32_t>(signal), ""}));
    }
}

TEST(PosixProcess, RunsWithStandardDescriptorsClosedOrChildrenIgnored) {
    for (int closed = 0; closed < 8; ++closed) {
        for (const bool settled : {true, false}) {
            EXPECT_EQ(inFork([closed, settled] {
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
                          const bool open =
                              fcntl(0, F_GETFD) != -1 && fcntl(1, F_GETFD) != -1 && fcntl(2, F_GETFD) != -1;
                          return first == Outcome{kSuccess, 5, "said"} && first == childOutcome("print said cried 5") &&
                                 (open || !settled);
                      }),
                      0)
                << closed << settled;
        }
    }
}

TEST(PosixProcess, TheProgramsOwnOutputStaysWhereItWent) {
    const TemporaryDirectory folder;
    const std::string output = folder.path() + "/output";
    const std::string error = folder.path() + "/error";
    EXPECT_EQ(inFork([&] {
                  const bool redirected =
                      std::freopen(output.c_str(), "w", stdout) != nullptr && std::freopen(error.c_str(), "w", stderr);
                  EmbeddedProcessHost host("/nonexistent");
                  for (int run = 0; run < 4; ++run) {
                      std::printf("before %d\n", run);
                      std::fprintf(stderr, "error %d\n", run);
                      outcomeOf(host, childProgram() + (run == 2 ? "-missing.exe" : " print said cried 0"));
                      // What is opened now may have a number that a slot still holds in another form.
                      open(error.c_str(), O_RDONLY | O_CLOEXEC);
                  }
                  std::fflush(nullptr);
                  return redirected;
              }),
              0);
    const auto contents = [](const std::string& path) {
        std::ifstream file(path);
        return std::string(std::istreambuf_iterator<char>(file), {});
    };
    EXPECT_EQ(contents(output), "before 0\nbefore 1\nbefore 2\nbefore 3\n");
    EXPECT_EQ(contents(error), "error 0\nerror 1\nerror 2\nerror 3\n");
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
    std::uint32_t code = 0;
    Gate gate;
    Gate left;
    Gate later;
    // clang-format off
    const struct { std::string command; std::uint32_t timeout; bool wait; Gate* gate; } rows[] = {
        {childProgram() + " print a b 0",                kInfiniteWait, true,  nullptr},
        {childProgram() + " print a b 0",                kInfiniteWait, false, nullptr},
        {childProgram() + "-missing.exe",                kInfiniteWait, true,  nullptr},
        {childProgram() + " flood 1 0",                  kInfiniteWait, true,  nullptr},
        {childProgram() + " flood 0 0",                  1,             false, nullptr},
        {childProgram() + " leave " + left.name(),       kInfiniteWait, true,  &left},
        {childProgram() + " gate " + gate.name() + " 0", 0,             false, &gate},
    };
    // clang-format on
    for (const auto& row : rows) {
        {
            InstallProcess process(host, readers, sink, row.command.c_str());
            process.execute(row.wait, false);
            if (row.gate != nullptr && row.wait) {
                row.gate->open();
            }
            process.waitForCompletion(code, row.timeout);
        }
        EXPECT_EQ(entries("/proc/self/fd"), descriptors) << row.command;
        if (row.gate != nullptr && !row.wait) {
            row.gate->open();
        }
        EXPECT_TRUE(eventually(noChildren)) << row.command;
        EXPECT_TRUE(eventually([&] { return entries("/proc/self/task") == threads; })) << row.command;
    }
    {
        InstallProcess process(host, readers, sink, (childProgram() + " gate " + later.name() + " 0").c_str());
        process.execute(false, false);
    }
    later.open();
    EXPECT_TRUE(eventually(noChildren)) << "never waited for";
    EXPECT_TRUE(eventually([&] { return entries("/proc/self/task") == threads; }));
    EXPECT_EQ(entries("/proc/self/fd"), descriptors);
}

TEST(PosixProcess, RunsOutOfDescriptorsWithoutRunningAnything) {
    EXPECT_EQ(inFork([] {
                  EmbeddedProcessHost host("/nonexistent");
                  EmbeddedThreads threads;
                  QuietSink sink;
                  InstallProcess process(host, threads, sink, (childProgram() + " print said cried 5").c_str());
                  std::vector<int> taken;
                  for (int taking = dup(0); taking != -1; taking = dup(0)) {
                      taken.push_back(taking);
                  }
                  bool held = true;
                  std::uint32_t code = 0;
                  // One more free descriptor each time: the first run that is whole has all it needs.
                  for (int free = 0; code != 5 && held; ++free) {
                      held = process.execute(true, false) == kSuccess && free < 20;
                      const Status status = process.waitForCompletion(code, kInfiniteWait);
                      held =
                          held && (status == (code == 5 ? kSuccess : kNotExecuted) || status == kExitCodeUnavailable);
                      close(taken.back());
                      taken.pop_back();
                  }
                  return held && code == 5;
              }),
              0);
}

}  // namespace
}  // namespace kz7::test
