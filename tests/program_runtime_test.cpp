// The runtime and the front end as programs: an installer alone, with a misbehaving front end, and under kz7admin
// front.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <csignal>
#include <filesystem>

#include "tests/support/state_directory.h"

namespace kz7::test {
namespace {

class RuntimeProgram : public testing::Test {
protected:
    // A file next to the log.
    std::string path(const std::string& name) const { return store_.file(name); }
    std::string log() const { return contents(path("setup.log")); }
    std::string lastLine() const {
        std::string line = "MESSAGE INFO INSTALLEND :: " + path("setup.log") + "\n";
        std::replace(line.begin(), line.end(), '/', '\\');
        return line;
    }

    ProgramOptions withInput(const std::string& input) const {
        overwrite(path("input"), input);
        return {.environment = {}, .inChild = [file = path("input")] { dup2(open(file.c_str(), O_RDONLY), 0); }};
    }
    ProgramResult install(const ProgramOptions& options) const { return store_.run("kz7_installer", {"0"}, options); }
    ProgramResult front(std::vector<std::string> command, const std::string& input = {}) const {
        command.insert(command.begin(), {"front", "--"});
        return store_.run("kz7admin", std::move(command), withInput(input));
    }

    StateDirectory store_;
};

// The log of a run that was not aborted, from its tasks on.
constexpr const char* kLoggedRun =
    "\nTasks: 10,30;11,50;20,20\nCopying files\nNote: Installer::copy, step 10: 42 files\nCopying files\n"
    "Note: The installation medium was not found. Where is it?\n"
    "Registering the copy\nRegistering the copy\nCreating the instance\nCreating the instance\n\nInstallation ended: ";

TEST_F(RuntimeProgram, FinishesItsWorkOnAnyInput) {
    // clang-format off
    const struct { const char* why; std::string input; bool aborted; } rows[] = {
        {"nothing",           "",                                      false},
        {"1 MiB on a line",   std::string(1 << 20, 'A') + "\nABORT\n", false},
        {"NUL bytes",         std::string("\0\0ABORT\0\n", 9),         false},
        {"no line end",       "ABORT",                                 true},
    };
    // clang-format on
    for (const auto& row : rows) {
        std::filesystem::remove(path("setup.log"));
        const ProgramResult result = install(withInput(row.input));
        EXPECT_EQ(result.exitCode, row.aborted ? 1 : 0) << row.why;
        EXPECT_EQ(result.error, "") << row.why;
        EXPECT_TRUE(result.output.ends_with(
            std::string(row.aborted ? "\nMESSAGE INFO UNDOEND\n" : ":: 20 :: Creating the instance\n") + lastLine()))
            << row.why << result.output;
        EXPECT_EQ(log().find(kLoggedRun) != std::string::npos, !row.aborted) << row.why;
    }
}

TEST_F(RuntimeProgram, KeepsItsLogWithoutAReaderAndItsReaderWithoutALog) {
    const auto closed = [] {
        int ends[2];
        if (pipe(ends) == 0) {
            dup2(ends[1], 1);
            close(ends[0]);
            close(ends[1]);
        }
    };
    EXPECT_EQ(install({.environment = {}, .inChild = closed}).exitCode, 0);
    EXPECT_NE(log().find(kLoggedRun), std::string::npos);

    // Larger than standard output, which has the same limit.
    const std::string before = log() + std::string(10'000, 'x') + '\n';
    overwrite(path("setup.log"), before);
    const ProgramResult full = install({.environment = {}, .inChild = limitFileSize(before.size() + 50)});
    EXPECT_EQ(full.exitCode, 0);
    EXPECT_TRUE(full.output.ends_with(lastLine()));
    EXPECT_TRUE(log().starts_with(before)) << "the log of the earlier run stays";

    // A log that is a link is not written: another user may have created it.
    std::filesystem::remove(path("setup.log"));
    overwrite(path("precious"), "precious");
    std::filesystem::create_symlink(path("precious"), path("setup.log"));
    EXPECT_EQ(install({}).exitCode, 0);
    EXPECT_EQ(log(), "precious");
}

// The end of a program ends its question, although an answer could still arrive.
TEST_F(RuntimeProgram, FrontEndsWithAProgramThatAskedAndEnded) {
    overwrite(path("script"), "#!/bin/sh\necho 'MESSAGE QUERY CDPATH :: Where? :: '; exit 4\n");
    std::filesystem::permissions(path("script"), std::filesystem::perms::owner_all);
    const auto silent = [] {
        int ends[2];
        if (pipe(ends) == 0) {
            dup2(ends[0], 0);
        }
    };
    EXPECT_EQ(store_.run("kz7admin", {"front", "--", path("script")}, {.environment = {}, .inChild = silent}),
              (ProgramResult{4, "Where?\nAnswer, or ABORT: \n", path("script") + " ended with exit code 4.\n"}));
}

TEST_F(RuntimeProgram, TheExampleSurvivesAnyAllocationThatFails) {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    GTEST_SKIP() << "a sanitizer's allocator lets no other be loaded before it";
#endif
    for (int number = 1; number < 150; ++number) {
        const ProgramResult result = install({.environment = {"LD_PRELOAD=" KZ7_FAILING_CALLS, "KZ7_FAIL_CALL=malloc",
                                                              "KZ7_FAIL_AT=" + std::to_string(number)},
                                              .inChild = {}});
        EXPECT_TRUE(result.exitCode == 0 || result.exitCode == 14) << number << ": " << result.exitCode;
        EXPECT_TRUE(result.exitCode != 0 || result.output.find("\nMESSAGE INFO INSTALLEND :: ") != std::string::npos)
            << number << result.output;
    }
}

TEST_F(RuntimeProgram, FrontHandlesAnyProgram) {
    std::string bars;
    std::string complaints;
    for (int i = 0; i < 3000; ++i) {
        bars += "Installing: x\n";
        complaints += "y\n";
    }
    const std::string longest(std::size_t{64} * 1024, 'x');
    // clang-format off
    const struct { const char* why; std::string lines; int exitCode; std::string output; std::string error; } rows[] = {
        {"garbage and half a line", R"(printf 'a\001b\n\n\377\nPROGRESS TASK\nhalf'; exit 3)", 3,
                                    "a\\x01b\n\\xff\nPROGRESS TASK\nhalf\n", ""},
        {"its words", "shift; printf '%s\\n' \"$@\"", 0, "a b\n\"\\\n\\\\a\\\\\n'$*?\nDone.\n", ""},
        {"it dies",                 "echo x; kill -9 $$",                         137, "x\n", ""},
        {"it leaves a child that holds its output", "sleep 600 & echo $! > \"$1\"; echo x", 0, "x\nDone.\n", ""},
        {"a line over 64 KiB", "head -c 65546 /dev/zero | tr '\\0' x; printf '\\r\\nd\\n'", 0, longest + "\nd\nDone.\n", ""},
        {"it closes all and goes on", "exec <&- >&- 2>&-; sleep 0.1; exit 9",     9,   "", ""},
        {"it floods both streams",  "i=0; while [ $i -lt 3000 ]; do echo 'PROGRESS TASK START :: INSTALLATION :: 1 :: 1 :: x'; echo y >&2; i=$((i+1)); done; exit 300", 44, bars, complaints},
        {"it echoes its answer",    "echo 'MESSAGE QUERY CDPATH :: x :: '; read a; echo \"$a\"", 0,
                                    "x\nAnswer, or ABORT: /media\nRESPONSE :: /media\nDone.\n", ""},
    };
    // clang-format on
    const std::string program = path("script");
    for (const auto& row : rows) {
        overwrite(program, "#!/bin/sh\n" + row.lines + "\n");
        std::filesystem::permissions(program, std::filesystem::perms::owner_all);
        const std::string ended = program + " ended with exit code " + std::to_string(row.exitCode) + ".\n";
        const ProgramResult result =
            front({program, path("child"), "a b", "", "\"\\", "\\\\a\\\\", "'$*?"}, "/media\n");
        EXPECT_EQ(result, (ProgramResult{row.exitCode, row.output, row.error + (row.exitCode == 0 ? "" : ended)}))
            << row.why;
    }
    kill(std::stoi(contents(path("child"))), SIGKILL);
    EXPECT_EQ(front({"./script"}),
              (ProgramResult{127, "", "kz7admin: no such program: ./script (a path must be absolute)\n"}));
    EXPECT_EQ(front({"kz7 no such program"}).error, "kz7admin: no such program: kz7 no such program\n");
}

}  // namespace
}  // namespace kz7::test
