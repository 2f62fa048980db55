// kz7admin front in one process: how it reads lines, counts tasks and draws bars, and a whole run on a machine in
// memory.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "install/admin/front/command_words.h"
#include "install/admin/front/front.h"
#include "tests/support/machine.h"

namespace kz7::test {
namespace {

// Runs a program that prints those lines under the front end.
void runLines(Machine& machine, const std::string& lines) {
    machine.processes_.addProgram("setup.exe", {.output = lines});
    std::uint32_t exitCode = 4711;
    const FrontPorts ports{machine.processes_, machine.threads_, machine.files_, machine.terminal_, machine.console_};
    EXPECT_EQ(runFront(ports, {"setup.exe", "a b"}, exitCode), kSuccess);
    EXPECT_EQ(exitCode, 0U);
}

// A task counts once, by its announced time; a task that was not announced does not count; new tasks do not reduce the
// percentage.
TEST(Front, ShowsAnyLine) {
    // clang-format off
    const struct { const char* line; const char* shown; } rows[] = {
        {"MESSAGE INFO INSTALLSTARTED",                                  "MESSAGE INFO INSTALLSTARTED\n"},
        {"PROGRESS TASK START :: INSTALLATION :: 4294967295 :: -1 :: ",  "Installing\n"},
        {"PROGRESS TASK START :: INSTALLATION :: 4294967296 :: 1 :: x",  "PROGRESS TASK START :: INSTALLATION :: 4294967296 :: 1 :: x\n"},
        {"PROGRESS TASK START :: INSTALLATION :: 40",                    "PROGRESS TASK START :: INSTALLATION :: 40\n"},
        {"PROGRESS TASK END :: ELSEWHERE :: 10 :: x",                    "PROGRESS TASK END :: ELSEWHERE :: 10 :: x\n"},
        {"PROGRESS INFO TASKCOUNT :: two",                               "PROGRESS INFO TASKCOUNT :: two\n"},
        {"PROGRESS INFO TASKCOUNT :: 4",                                 ""},
        {"PROGRESS INFO TASKIDS :: 10 :: 11 :: 12 :: x",                 ""},
        {"PROGRESS INFO TASKTIMES :: 30 :: 50 ::  :: 2",                 ""},
        {"PROGRESS TASK START :: INSTALLATION :: 0 :: 10 :: a :: b",     "Installing 0%: a :: b\n"},
        {"PROGRESS TASK END :: INSTALLATION :: 10 :: a :: b",            "Installing 36%: a :: b, done\n"},
        {"PROGRESS TASK END :: INSTALLATION :: 10 :: again",             "Installing 36%: again, done\n"},
        {"PROGRESS TASK END :: INSTALLATION :: 99 :: b",                 "Installing 36%: b, done\n"},
        {"PROGRESS INFO TASKIDS :: 10 :: 11 :: 12 :: 13 :: 14",          ""},
        {"PROGRESS TASK START :: INSTALLATION :: 0 :: 11 :: c",          "Installing 36%: c\n"},
        {"PROGRESS TASK END :: INSTALLATION :: 11 :: c",                 "Installing 40%: c, done\n"},
        {"PROGRESS TASK START :: CONFIGURATION :: 0 :: 13 :: d",         "Installing 100%: done\nConfiguring 0%: d\n"},
        {"PROGRESS TASK END :: CONFIGURATION :: 13 :: d",                "Configuring 33%: d, done\n"},
        {"PROGRESS INFO TASKTIMES :: 999999999999999999999 :: -5 :: 4000000000", ""},
        {"PROGRESS TASK END :: CONFIGURATION :: 14 :: e",                "Configuring 33%: e, done\n"},
        {"MESSAGE ERROR LATER :: of a newer :: program",                 "error: of a newer :: program\n"},
        {"MESSAGE QUERY CDPATH :: Where :: is it? :: D:\\",              "Where :: is it?\nAnswer, or ABORT [D:\\]: D:\\\n"},
        {"MESSAGE QUERY CDPATH :: Where? :: ",                           "Where?\nAnswer, or ABORT: x\n"},
        {"MESSAGE QUERY CDPATH :: Where? ::",                            "Where?\nAnswer, or ABORT: ABORT\n"},
        {"MESSAGE QUERY CDPATH :: Where?",                               "Where?\nAnswer, or ABORT: ABORT\n"},
        {"MESSAGE QUERY OTHER :: Where? :: x",                           "MESSAGE QUERY OTHER :: Where? :: x\n"},
        {"MESSAGE INFO INSTALLEND :: \\var\\a :: b.log",                ""},
        {"",                                                             ""},
    };
    // clang-format on
    Machine machine;
    machine.terminal_.input = "\nx\nabort\n";
    std::string lines;
    std::string shown;
    for (const auto& row : rows) {
        lines.append(row.line).append("\n");
        shown += row.shown;
    }
    runLines(machine, lines);
    EXPECT_EQ(machine.console_.both, shown + "Configuring 100%: done\nThe log is \\var\\a :: b.log\nDone.\n");
}

TEST(Front, PassesNoSpecialCharactersToABatchFile) {
    // clang-format off
    const struct { std::vector<std::string> words; bool passed; } rows[] = {
        {{"x.bat", "plain", "a & b", "^<>|()!", "C:\\KZ7\\"},  true},
        {{"x.bat", "a\" & echo INJECTED & rem \""},          false},
        {{"x.exe", "a\" & echo INJECTED & rem \"%PATH%\n"},   true},
        {{"C:\\a b\\X.Cmd", "%PATH:~0,3%"},                   false},
        {{"x.cmd. .", "two\r\nlines"},                        false},
        {{"C:\\%PATH%\\x.bat"},                               false},
        {{"x.bat", std::string("\0", 1)},                     false},
        {{".bat", "\x7F"},                                    false},
        {{"bat", "%"},                                        true},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(canPassWords(row.words), row.passed) << joinArguments(row.words);
    }
}

TEST(FrontScreen, BarsFitTheirColumns) {
    // clang-format off
    const struct { FrontScreen::Bar bar; std::uint32_t columns; const char* line; } rows[] = {
        {{"Installing", 50, "Copying files"}, 79,  "Installing   [##############..............]  50% Copying files"},
        {{"Installing", 50, "Copying files", "0:35, 1:10 left"}, 79, "Installing   [##############..............]  50% 0:35, 1:10 left Copying files"},
        {{"Installing", 100, "done"},         200, "Installing   [########################################] 100% done"},
        {{"Installing", 30, "Copying files"}, 30,  "Installing 30%: Copying files"},
        {{"Undoing", -1, "taken back"},       15,  "Undoing      ta"},
        {{"Installing", 0, "\xE6\x97\xA5\xE6\x9C\xAC\xC3\xA4"}, 36, "Installing   [..........]   0% \xE6\x97\xA5\xE6\x9C\xAC\xC3\xA4"},
        {{"Installing", 0, "\xE6\x97\xA5\xE6\x9C\xAC\xC3\xA4"}, 34, "Installing   [..........]   0% \xE6\x97\xA5"},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(barLine(row.bar, row.columns), row.line) << row.columns;
    }
}

TEST(Front, EstimatesByAnnouncedTimesThenByMeasuredOnes) {
    FrontProgress progress;
    progress.takeIds({"1", "2", "3"});
    progress.takeTimes({"30", "10", "20"});
    // clang-format off
    const struct { std::int32_t started; std::int32_t ended; std::uint64_t now; std::uint64_t left; } rows[] = {
        {1, 0, 0,  60}, {0, 0, 5, 55}, {0, 0, 40, 30},  // an overdue task does not reduce the time of the others
        {0, 1, 60, 60}, {2, 0, 60, 60}, {0, 0, 70, 50}, {3, 2, 80, 40}, {0, 3, 120, 0},
    };
    // clang-format on
    for (const auto& row : rows) {
        if (row.ended != 0) {
            progress.endTask(row.ended, row.now);
        }
        if (row.started != 0) {
            progress.startTask(row.started, row.now);
        }
        EXPECT_EQ(progress.secondsLeft(row.now), row.left) << row.now;
    }
}

TEST(Front, DrawsOneBarForEachPhaseOnATerminal) {
    Machine machine;
    machine.terminal_.view = {.terminal = true, .redraws = true, .colours = true, .columns = 40};
    runLines(machine,
             "MESSAGE INFO INSTALLSTART\n"
             "PROGRESS INFO TASKIDS :: 1 :: 2\nPROGRESS INFO TASKTIMES :: 3 :: 1\n"
             "PROGRESS TASK START :: INSTALLATION :: 0 :: 1 :: Files\n"
             "MESSAGE QUERY CDPATH :: Where? :: D:\\\n\n"
             "PROGRESS TASK END :: INSTALLATION :: 1 :: Files\n"
             "garbage \x1b[2J\n"
             "MESSAGE ERROR GENERAL :: it failed\n"
             "MESSAGE INFO UNDOSTART\nMESSAGE INFO UNDOEND\n"
             "MESSAGE INFO INSTALLEND :: C:\\x.log\n"
             "half");
    EXPECT_EQ(machine.processes_.started, std::vector<std::string>{"\"setup.exe\" \"a b\""});
    EXPECT_FALSE(machine.terminal_.leavesInterrupts);
    const std::string wipe = "\r\x1b[K";
    const std::string bar = wipe + "Installing   [#######...]  75% Files, d";
    EXPECT_EQ(machine.console_.both,
              wipe + "Installing   [..........]   0% Files" + wipe + "Where?\nAnswer, or ABORT [D:\\]: ABORT\n" + bar +
                  wipe + "garbage \\x1b[2J\n" + bar + wipe + "\x1b[31merror: it failed\n\x1b[0m" + bar + "\n" + wipe +
                  "Undoing      what was done is taken bac" + wipe + "Undoing      done" + wipe + "half\n" + wipe +
                  "Undoing      done\n" + "The log is C:\\x.log\nDone.\n");
}

}  // namespace
}  // namespace kz7::test
