// What a front end is told and answers: single lines, the queue, whole runs to the byte, and what goes wrong.
#include <gtest/gtest.h>

#include <array>
#include <new>

#include "install/runtime/observers/display_observer.h"
#include "install/runtime/observers/external_output_pipe.h"
#include "install/runtime/observers/protocol_lines.h"
#include "tests/support/runtime_machine.h"

namespace kz7::test {

static int allocationsUntilFailure = -1;  // of those that answer null; below 0 none fails

}  // namespace kz7::test

void* operator new[](std::size_t size, const std::nothrow_t&) noexcept {
    if (kz7::test::allocationsUntilFailure >= 0 && kz7::test::allocationsUntilFailure-- == 0) {
        return nullptr;
    }
    try {
        return ::operator new[](size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

namespace kz7::test {
namespace {

using namespace std::literals;
using Response = UREInfo::Response;

TEST(ProtocolLines, KeepTheirLineFeedAndTellNoOtherEvent) {
    ProtocolLine line;
    EXPECT_TRUE(progressLine({ProgressKind::end, 0, 1, true, std::string(5000, 'x')}, line));
    EXPECT_EQ(line.view().size(), 1023U);
    EXPECT_EQ(line.view().substr(1020), "xx\n");
    EXPECT_EQ(queryLine(std::string(3000, 'a'), "b").view().substr(1020), "aa\n");
    EXPECT_FALSE(progressLine({ProgressKind{0x300}, 1, 1, true, "x"}, line));
}

TEST(ProtocolLines, TellTaskLists) {
    const std::string twenty = "12345678901234567890";
    // clang-format off
    const struct { const char* why; std::string list; int count; std::string identifiers; std::string times; } rows[] = {
        {"two",                          "10,30;11,45",     2, " :: 10 :: 11",     " :: 30 :: 45"},
        {"an end mark adds none",        "10,30;11,45;",    2, " :: 10 :: 11",     " :: 30 :: 45"},
        {"a missing time",               "10;11,5",         2, " :: 10 :: 11",     " ::  :: 5"},
        {"an empty entry",               "1,2;;3,4",        3, " :: 1 ::  :: 3",   " :: 2 ::  :: 4"},
        {"an entry is cut as a whole",   "1," + twenty,     1, " :: 1",            " :: 12345678901234567"},
        {"an identifier of 20",          twenty + ",5",     1, " :: 1234567890123456789", " :: "},
        {"line ends",                    "1,2\n;3,4",       2, " :: 1 :: 3",       " :: 2  :: 4"},
    };
    // clang-format on
    for (const auto& row : rows) {
        const TaskListLines lines = taskListLines(row.list);
        EXPECT_EQ(lines.count.view(), "PROGRESS INFO TASKCOUNT :: " + std::to_string(row.count) + "\n") << row.why;
        EXPECT_EQ(lines.identifiers.view(), "PROGRESS INFO TASKIDS" + row.identifiers) << row.why;
        EXPECT_EQ(lines.times.view(), "PROGRESS INFO TASKTIMES" + row.times) << row.why;
    }
    const TaskListLines many = taskListLines(std::string(3000, ';'));
    EXPECT_EQ(many.count.view(), "PROGRESS INFO TASKCOUNT :: 1024\n") << "1,024 characters are read";
    EXPECT_EQ(many.identifiers.view().size(), 1024U);
}

TEST(ProtocolLines, TakeAnswers) {
    const auto all = [](std::initializer_list<const char*> lines, AnswerLine answer) {
        for (const char* line : lines) {
            EXPECT_EQ(parseAnswer(line), answer) << line;
        }
    };
    all({"ABORT", "ABORTED"}, AnswerLine::abort);
    all({"RESPONSE :: E", "RESPONSE::E", "RESPONSE: ", "RESPONSEX:E"}, AnswerLine::response);
    all({"ABOR", "abort", " ABORT", "", "RESPONSE", "RESPONSE:", "RESPONSE:::", "RESPONSEX", "RESPONSE 5",
         "response :: E", "RESPONS:E", ":RESPONSE:E"},
        AnswerLine::ignored);
}

TEST(Pipe, QueuesAndWrites) {
    RuntimeMachine machine;
    UREExternalOutputPipe pipe(machine.console_, machine.lines_, machine.engine);
    EXPECT_EQ(pipe.addQueueMessage(nullptr), kSuccess);
    EXPECT_EQ(pipe.addQueueMessage(""), kSuccess);
    EXPECT_EQ(pipe.getQueueCount(), 0);
    std::string expected;
    for (int i = 0; i < 9; ++i) {
        const std::string text(i == 4 ? 2000U : 3U, static_cast<char>('a' + i));
        EXPECT_EQ(pipe.addQueueMessage(text.c_str()), kSuccess);
        expected += text.substr(0, 1024);
    }
    EXPECT_EQ(pipe.getQueueCount(), 9);
    EXPECT_EQ(machine.console_.output, "");
    EXPECT_EQ(pipe.flushQueue(), kSuccess);
    EXPECT_EQ(pipe.getQueueCount(), 0);
    EXPECT_EQ(machine.console_.output, expected);
    EXPECT_EQ(machine.console_.flushed, expected.size());
    machine.console_.output.clear();
    for (const char* text : {"100%%|", "%%%|", "%%%%|", "%|", "a%s%n%5d%%b|", ""}) {
        pipe.writeMessage(text);
    }
    pipe.writeMessage(nullptr);
    EXPECT_EQ(machine.console_.output, "100%|%%|%%|%|a%s%n%5d%b|");
}

TEST(Pipe, ReadsAnswerLines) {
    RuntimeMachine machine;
    machine.lines_.input =
        "one\r\ntwo\rx\n\n123456789\nnext\n" + std::string(1 << 20, 'x') + "\nABORT\n" + std::string("a\0b\nc", 5);
    UREExternalOutputPipe pipe(machine.console_, machine.lines_, machine.engine);
    std::string lines;
    for (char buffer[8]; pipe.readResponse(buffer, sizeof buffer) == kSuccess;) {
        lines.append(buffer).append("|");
    }
    EXPECT_EQ(lines, "one|two\rx||1234567|next|xxxxxxx|ABORT|a|c|")
        << "the rest of a long line is lost, a NUL ends a text, the last line needs no end";
}

// A run as an installer makes it: tasks, errors, questions, a roll-back.
void runInstallation(URE& engine, std::vector<UREInfo::Response>& responses) {
    std::string answer = "unchanged";
    engine.announceTasks("10,30;11,45;");
    engine.startTask(40, 10, true, "Copying files");
    engine.trace(kTraceError, "Copier::copy", 10, kSuccess, "42 files");
    responses.push_back(engine.ask(1, kMediumNeededMessage, {}, "D:\\", answer));
    engine.endTask(10, true, "Copying files");
    engine.startTask(5, 11, false, "100%% of the\nconfiguration");
    responses.push_back(engine.ask(7, kTextMessage, std::array<Insert, 1>{"Go on?"}, "yes", answer));
    engine.error(kCodeError, "Copier::configure", 20, kNotExecuted);
    engine.post(997, 1 | 0x4000000, "setDBMUsingProcess", "SQL0000");
    engine.message(0x24000005, kTextMessage, std::array<Insert, 1>{"other"});
    engine.message(0x01000005, kTextMessage, std::array<Insert, 1>{"not for front ends"});
    engine.startTask(0, kUndoTask, true, "undo");
    engine.endTask(kUndoTask, false, "undo");
    engine.startTask(0x1FFFFFFFF, -1, true, "a\r\n :: %s%n%%");
    engine.endTask(5, false, std::string_view("a\0b", 3));
    responses.push_back(engine.ask(2, 1, {}, "", answer));
    EXPECT_EQ(answer, "");
}

constexpr const char* kMachineRun =
    "MESSAGE INFO INSTALLSTART\n"
    "PROGRESS INFO TASKCOUNT :: 2\nPROGRESS INFO TASKIDS :: 10 :: 11\nPROGRESS INFO TASKTIMES :: 30 :: 45\n"
    "PROGRESS TASK START :: INSTALLATION :: 40 :: 10 :: Copying files\n"
    "MESSAGE ERROR CDNOTFOUND :: Install CD not found\n"
    "MESSAGE QUERY CDPATH :: The installation medium was not found. Where is it? :: D:\\\n\n"
    "PROGRESS TASK END :: INSTALLATION :: 10 :: Copying files\n"
    "PROGRESS TASK START :: CONFIGURATION :: 5 :: 11 :: 100% of the configuration\n"
    "MESSAGE QUERY CDPATH :: Go on? :: yes\n\n"
    "MESSAGE ERROR GENERAL :: Copier::configure, step 20: error 5030: The program was not run, or it failed.\n"
    "MESSAGE ERROR GENERAL :: The program wrote: SQL0000\nMESSAGE ERROR GENERAL :: other\n"
    "MESSAGE INFO UNDOSTART\nMESSAGE INFO UNDOEND\n"
    "PROGRESS TASK START :: INSTALLATION :: 4294967295 :: -1 :: a   :: %s%n%\nPROGRESS TASK END :: CONFIGURATION :: 5 "
    ":: a\n"
    "MESSAGE QUERY CDPATH :: The text of message 0x44000002 is missing. :: \n\n"
    "MESSAGE INFO INSTALLEND :: C:\\Setup Logs\\setup.log\n";

const std::string kRunInLog =
    "Tasks: 10,30;11,45;\nCopying files\nNote: Copier::copy, step 10: 42 files\n"
    "Note: The installation medium was not found. Where is it?\nCopying files\n"
    "100%% of the\nconfiguration\nGo on?\n"
    "ERROR: Copier::configure, step 20: error 5030: The program was not run, or it failed.\n"
    "Note: The program wrote: SQL0000\nNote: other\nnot for front ends\nundo\nundo\na\r\n :: %s%n%%\na\0b\n"
    "WARNING: The text of message 0x44000002 is missing.\n"s;

TEST(MachineStream, TellsAWholeRunToTheByte) {
    RuntimeMachine machine;
    machine.lines_.input = "RESPONSE :: E\r\nsomething else\nABORT\n";
    machine.openLog();
    std::vector<Response> responses;
    const std::string log = machine.logged([&] {
        const Shown<UREExternalObserverMachineStream> shown(machine.engine);
        EXPECT_TRUE(machine.lines_.keepsLineFeeds);
        runInstallation(machine.engine, responses);
    });
    EXPECT_FALSE(machine.lines_.keepsLineFeeds);
    EXPECT_EQ(responses, (std::vector{Response::answered, Response::none, Response::aborted}));
    EXPECT_EQ(machine.console_.output, kMachineRun);
    EXPECT_EQ(machine.console_.flushed, machine.console_.output.size());
    EXPECT_EQ(log, kRunInLog);
}

TEST(Pipe, AnAllocationThatFailsIsReportedAndLosesOneLine) {
    // The queue is made of an array and 4 buffers; the fifth line asks for an array and 4 buffers more.
    for (int failing = 0; failing < 11; ++failing) {
        RuntimeMachine machine;
        machine.openLog();
        const std::string step =
            (failing % 5 == 0 ? "10" : "20") + std::string(": error 5002: There is not enough memory.\n");
        const std::string log = machine.logged([&] {
            allocationsUntilFailure = failing;
            UREExternalOutputPipe pipe(machine.console_, machine.lines_, machine.engine);
            for (int line = 1; line <= 5; ++line) {
                const bool kept = failing >= 5 && (line < 5 || failing >= 10);
                EXPECT_EQ(pipe.addQueueMessage("x"), kept ? kSuccess : kFailed) << failing << line;
            }
            allocationsUntilFailure = -1;
            pipe.addQueueMessage("y");
            pipe.flushQueue();
        });
        std::string expected;
        if (failing < 5) {  // nothing is ever queued
            expected = "ERROR: UREExternalOutputPipe::UREExternalOutputPipe, step " + step;
            for (int line = 0; line < 6; ++line) {
                expected += "ERROR: UREExternalOutputPipe::addQueueMessage, step 10" + step.substr(2);
            }
        } else if (failing < 10) {
            expected = "ERROR: UREExternalOutputPipe::addQueueMessage, step " + step;
        }
        EXPECT_EQ(log, expected) << failing;
        EXPECT_EQ(machine.console_.output, failing < 5 ? "" : failing < 10 ? "xxxxy" : "xxxxxy") << failing;
    }
}

TEST(HumanStream, IsReadableAndAsWideAsTheTerminal) {
    RuntimeMachine machine;
    machine.terminal_.view = {.terminal = true, .redraws = true, .colours = true, .columns = 30};
    machine.lines_.input = "/media/disc\n\nABORT\n";
    const Shown<UREExternalObserverHumanStream> shown(machine.engine);
    std::string answer = "unchanged";
    machine.engine.startTask(1, 10, true, "Copying files");
    machine.engine.announceTasks("1,2");
    machine.engine.error(kCodeError, "Copier::copy", 10, kDiskFull);
    EXPECT_EQ(machine.engine.ask(1, kMediumNeededMessage, {}, "D:\\", answer), Response::answered);
    EXPECT_EQ(answer, "/media/disc");
    EXPECT_EQ(machine.engine.ask(2, kMediumNeededMessage, {}, "D:\\", answer), Response::answered);
    EXPECT_EQ(answer, "D:\\");
    machine.terminal_.view.columns = 0;
    EXPECT_EQ(machine.engine.ask(2, kMediumNeededMessage, {}, "D:\\", answer), Response::aborted);
    machine.engine.message(0x01000005, kTextMessage,
                           std::array<Insert, 1>{"a text that nobody breaks where there is no width"});
    machine.engine.endTask(10, true, "Copying files");
    machine.engine.startTask(1, kUndoTask, true, "");
    EXPECT_EQ(machine.engine.ask(2, kTextMessage, std::array<Insert, 1>{"Sure?"}, "", answer), Response::none);
    const std::string asked = "The installation medium was\nnot found. Where is it? [D:\\]\n(ABORT to stop): \n";
    EXPECT_EQ(machine.console_.output,
              "Copying files ...\n"
              "Error: Copier::copy, step 10:\nerror 112\n" +
                  asked + asked + "The installation medium was not found. Where is it? [D:\\] (ABORT to stop): \n" +
                  "a text that nobody breaks where there is no width\n"
                  "Copying files: done\n"
                  "Undoing what was done ...\n"
                  "Sure? [] (ABORT to stop): \n");
}

TEST(HumanStream, BreaksLinesWhereTheyFit) {
    // clang-format off
    const struct { const char* why; std::string_view text; std::uint32_t columns; const char* lines; } rows[] = {
        {"fits",                     "abc def",        7, "abc def|"},
        {"breaks at a blank",        "abc def",        6, "abc|def|"},
        {"a blank at the edge",      "abcdef ghi",     6, "abcdef|ghi|"},
        {"a long word",              "abcdefgh",       3, "abc|def|gh|"},
        {"line feeds",               "a\n\nb",         5, "a||b|"},
        {"no width",                 "abc def",        0, "abc def|"},
        {"wider than the terminal",  "a\xE2\x82\xACx",  1, "a|\xE2\x82\xAC|x|"},
        {"characters, not bytes",    "\xC3\xA4\xC3\xB6\xC3\xBC x", 3, "\xC3\xA4\xC3\xB6\xC3\xBC|x|"},
    };
    // clang-format on
    for (auto row : rows) {
        std::string lines;
        while (!row.text.empty()) {
            lines.append(takeWrappedLine(row.text, row.columns)).append("|");
        }
        EXPECT_EQ(lines, row.lines) << row.why;
    }
}

TEST(DisplayObserver, ShowsInfosInTheInstaller) {
    RuntimeMachine machine(true);
    UREDisplayObserverWI display(machine.engine, machine.session);
    machine.engine.registerObserver(display);
    machine.session.properties = {{"KZ7_DEFAULT_LANG", "en_US"}, {"Secret", "hunter2"}};
    std::string answer = "unchanged";
    machine.engine.startTask(1, 10, true, "Copying [Secret]");
    machine.engine.endTask(10, true, "Copying");
    machine.engine.trace(kTraceError, "x", 10, kSuccess, "not shown");
    machine.engine.announceTasks("1,2");
    machine.engine.message(0x01000005, kTextMessage, std::array<Insert, 1>{"one file"});
    machine.session.answer = kBoxAnswerCancel;
    EXPECT_EQ(machine.engine.ask(1, kTextMessage, std::array<Insert, 1>{"Go on?"}, "yes", answer),
              UREInfo::Response::aborted);
    machine.session.properties["KZ7_DEFAULT_LANG"] = "iw_IL";
    machine.session.answer = kBoxAnswerOk;
    EXPECT_EQ(machine.engine.ask(1, kTextMessage, std::array<Insert, 1>{"Go on?"}, "yes", answer),
              UREInfo::Response::answered);
    EXPECT_EQ(answer, "yes");
    machine.session.properties["KZ7_DEFAULT_LANG"] = "ar_AA";
    machine.engine.message(0x04000100, kTextMessage, std::array<Insert, 1>{"it failed"});
    machine.engine.unregisterObserver(display);

    std::string shown;
    for (const auto& message : machine.session.messages) {
        char kind[16];
        std::snprintf(kind, sizeof kind, "%08x", message.kind);
        shown += kind;
        for (const std::string& field : message.fields) {
            shown += '|' + field;
        }
        shown += '\n';
    }
    EXPECT_EQ(shown,
              "08000000||KZ7CustomAction|Copying [Secret]\n"
              "09000000|[1]|one file\n"
              "03000021|[1]\n\n[2]|KZ7 Setup|Go on?\n"
              "03180021|[1]\n\n[2]|KZ7 Setup|Go on?\n"
              "01180010|[1]\n\n[2]|KZ7 Setup|it failed\n");
}

}  // namespace
}  // namespace kz7::test
