// kz7admin front in one process: how it reads lines, counts tasks, draws bars, and a whole run on a machine in
// memory.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "install/admin/front.h"
#include "tests/support/machine.h"

namespace kz7::test {
namespace {

std::string shown(const ProtocolEvent& event) {
    static constexpr const char* kNames[] = {"installStart", "installEnd", "undoStart", "undoEnd",   "taskStart",
                                             "taskEnd",      "taskCount",  "taskIds",   "taskTimes", "error",
                                             "query",        "other",      "nothing"};
    std::string text = kNames[static_cast<int>(event.kind)];
    if (event.kind == EventKind::taskStart || event.kind == EventKind::taskEnd) {
        text += event.isInstallation ? " i" : " c";
        text += ' ' + std::to_string(event.startValue) + ' ' + std::to_string(event.task);
    }
    for (const std::string_view field : event.fields) {
        text += " <" + std::string(field) + '>';
    }
    if (event.kind == EventKind::query) {
        text += " <" + std::string(event.proposal) + '>';
    }
    return text + '|' + std::string(event.text);
}

TEST(ProtocolReader, TakesAnyLine) {
    // clang-format off
    const struct { const char* line; const char* event; } rows[] = {
        {"MESSAGE INFO INSTALLSTART",                               "installStart|"},
        {"MESSAGE INFO INSTALLSTARTED",                             "other|MESSAGE INFO INSTALLSTARTED"},
        {"MESSAGE INFO INSTALLEND :: \\var\\a :: b.log",            "installEnd|\\var\\a :: b.log"},
        {"PROGRESS TASK START :: INSTALLATION :: 40 :: 10 :: a :: b", "taskStart i 40 10|a :: b"},
        {"PROGRESS TASK START :: CONFIGURATION :: 4294967295 :: -1 :: ", "taskStart c 4294967295 -1|"},
        {"PROGRESS TASK END :: CONFIGURATION :: 10 :: x",           "taskEnd c 0 10|x"},
        {"PROGRESS TASK START :: INSTALLATION :: 40",               "other|PROGRESS TASK START :: INSTALLATION :: 40"},
        {"PROGRESS TASK START :: INSTALLATION :: 4294967296 :: 1 :: x", "other|PROGRESS TASK START :: INSTALLATION :: 4294967296 :: 1 :: x"},
        {"PROGRESS INFO TASKCOUNT :: two",                          "other|PROGRESS INFO TASKCOUNT :: two"},
        {"PROGRESS INFO TASKIDS :: 10 :: 11",                       "taskIds <10> <11>|"},
        {"PROGRESS INFO TASKTIMES ::  :: 45",                       "taskTimes <> <45>|"},
        {"MESSAGE ERROR LATER :: of a newer :: program",            "error|of a newer :: program"},
        {"MESSAGE QUERY CDPATH :: Where :: is it? :: D:\\",         "query <D:\\>|Where :: is it?"},
        {"MESSAGE QUERY CDPATH :: Where? :: ",                      "query <>|Where?"},
        {"MESSAGE QUERY CDPATH :: Where?",                          "query <>|Where?"},
        {"MESSAGE QUERY OTHER :: Where? :: x",                      "other|MESSAGE QUERY OTHER :: Where? :: x"},
        {"",                                                        "nothing|"},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(shown(readProtocolLine(row.line)), row.event) << row.line;
    }
}

TEST(FrontScreen, BarsFitTheirColumns) {
    // clang-format off
    const struct { FrontScreen::Bar bar; std::uint32_t columns; const char* line; } rows[] = {
        {{"Installing", 50, "Copying files"}, 79,  "Installing   [##############..............]  50% Copying files"},
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

TEST(Front, DrawsOneBarForEachPhaseOnATerminal) {
    Machine machine;
    machine.terminal_.view = {.terminal = true, .redraws = true, .colours = true, .columns = 40};
    machine.processes_.addProgram(
        "setup.exe",
        {.output = "MESSAGE INFO INSTALLSTART\n"
                   "PROGRESS INFO TASKCOUNT :: 2\nPROGRESS INFO TASKIDS :: 1 :: 2\nPROGRESS INFO TASKTIMES :: 3 :: 1\n"
                   "PROGRESS TASK START :: INSTALLATION :: 0 :: 1 :: Files\n"
                   "MESSAGE QUERY CDPATH :: Where? :: D:\\\n\n"
                   "PROGRESS TASK END :: INSTALLATION :: 1 :: Files\n"
                   "garbage \x1b[2J\n"
                   "MESSAGE ERROR GENERAL :: it failed\n"
                   "MESSAGE INFO UNDOSTART\nMESSAGE INFO UNDOEND\n"
                   "MESSAGE INFO INSTALLEND :: C:\\x.log\n"
                   "half"});
    std::uint32_t exitCode = 4711;
    EXPECT_EQ(runFront({machine.processes_, machine.threads_, machine.files_, machine.lines_, machine.terminal_,
                        machine.console_},
                       {"setup.exe", "a b"}, exitCode),
              kSuccess);
    EXPECT_EQ(exitCode, 0U);
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
