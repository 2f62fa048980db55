// The progress protocol and the streams for people: single lines, the queue, whole runs to the byte.
#include <gtest/gtest.h>

#include <array>

#include "install/runtime/observers/display_observer.h"
#include "install/runtime/observers/external_output_pipe.h"
#include "install/runtime/observers/protocol_lines.h"
#include "tests/support/runtime_machine.h"

namespace kz7::test {
namespace {

using namespace std::literals;
using Response = UREInfo::Response;

TEST(ProtocolLines, EndInALineFeedWhenCutAndIgnoreOtherEvents) {
    ProtocolLine line;
    EXPECT_TRUE(progressLine({ProgressKind::end, 0, 1, true, std::string(5000, 'x')}, line));
    EXPECT_EQ(line.view().size(), 1023U);
    EXPECT_EQ(line.view().substr(1020), "xx\n");
    EXPECT_EQ(queryLine(std::string(3000, 'a'), "b").view().substr(1020), "aa\n");
    EXPECT_FALSE(progressLine({ProgressKind{0x300}, 1, 1, true, "x"}, line));
    const TaskListLines many = taskListLines(std::string(3000, ';'));
    EXPECT_EQ(many.count.view(), "PROGRESS INFO TASKCOUNT :: 1024\n") << "1,024 characters are read";
    EXPECT_EQ(many.identifiers.view().size(), 1024U);
}

TEST(ProtocolLines, ParseAnswers) {
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

TEST(Pipe, WritesWhatIsQueuedCutAndWithPercentSignsOnce) {
    RuntimeMachine machine;
    UREExternalOutputPipe pipe(machine.console_, machine.terminal_, machine.engine);
    const std::string cut(1024, 'x');
    const std::string tooLong = cut + 'y';
    for (const char* text : {"100%%|", "%%%|", "", "%%%%|", "%|", "a%s%n%5d%%b|", tooLong.c_str()}) {
        EXPECT_EQ(pipe.addQueueMessage(text), kSuccess);
    }
    EXPECT_EQ(pipe.addQueueMessage(nullptr), kSuccess);
    EXPECT_EQ(pipe.getQueueCount(), 6);
    EXPECT_EQ(machine.console_.output, "");
    EXPECT_EQ(pipe.flushQueue(), kSuccess);
    pipe.writeMessage(nullptr);
    EXPECT_EQ(pipe.getQueueCount(), 0);
    EXPECT_EQ(machine.console_.output, "100%|%%|%%|%|a%s%n%5d%b|" + cut);
    EXPECT_EQ(machine.console_.flushed, machine.console_.output.size());
}

// The calls of an installer: tasks, errors, questions, a roll-back. Entries of a task list are cut as a whole, and an
// answer line that is too long is one line.
TEST(MachineStream, WritesAWholeRunExactly) {
    RuntimeMachine machine;
    URE& engine = machine.engine;
    machine.terminal_.input = "RESPONSE :: E\r\n" + std::string(5000, 'x') + "ABORT\nABORT\n";
    machine.openLog();
    std::vector<Response> responses;
    std::string answer = "unchanged";
    engine.registerObserver(*UREExternalObserverMachineStream::getInstance(engine));
    EXPECT_TRUE(machine.terminal_.keepsLineFeeds);
    engine.announceTasks("10,30;;11;1,2\n;12345678901234567890,5;1,12345678901234567890;");
    engine.startTask(40, 10, true, "Copying files");
    engine.trace(kTraceError, "Copier::copy", 10, kSuccess, "42 files");
    responses.push_back(engine.ask(1, kMediumNeededMessage, {}, "D:\\", answer));
    engine.endTask(10, true, "Copying files");
    engine.startTask(5, 11, false, "100%% of the\nconfiguration");
    responses.push_back(engine.ask(7, kTextMessage, std::array<Insert, 1>{"Go on?"}, "yes", answer));
    engine.error(kCodeError, "Copier::configure", 20, kNotExecuted);
    engine.post(997, 1 | 0x4000000, "setDBMUsingProcess", "SQL0000");
    machine.say(0x24000005, "other");
    machine.say(0x01000005, "not for front ends");
    engine.startTask(0, kUndoTask, true, "undo");
    engine.endTask(kUndoTask, false, "undo");
    engine.startTask(0x1FFFFFFFF, -1, true, "a\r\n :: %s%n%%");
    engine.endTask(5, false, "a\0b"sv);
    responses.push_back(engine.ask(2, 1, {}, "", answer));
    { const ObserversEnd end; }
    EXPECT_FALSE(machine.terminal_.keepsLineFeeds);
    EXPECT_EQ(responses, (std::vector{Response::answered, Response::none, Response::aborted}));
    EXPECT_EQ(answer, "");
    EXPECT_EQ(machine.console_.flushed, machine.console_.output.size());
    EXPECT_EQ(
        machine.console_.output,
        "MESSAGE INFO INSTALLSTART\n"
        "PROGRESS INFO TASKCOUNT :: 6\n"
        "PROGRESS INFO TASKIDS :: 10 ::  :: 11 :: 1 :: 1234567890123456789 :: 1\n"
        "PROGRESS INFO TASKTIMES :: 30 ::  ::  :: 2  ::  :: 12345678901234567\n"
        "PROGRESS TASK START :: INSTALLATION :: 40 :: 10 :: Copying files\n"
        "MESSAGE ERROR CDNOTFOUND :: Install CD not found\n"
        "MESSAGE QUERY CDPATH :: The installation medium was not found. Where is it? :: D:\\\n\n"
        "PROGRESS TASK END :: INSTALLATION :: 10 :: Copying files\n"
        "PROGRESS TASK START :: CONFIGURATION :: 5 :: 11 :: 100% of the configuration\n"
        "MESSAGE QUERY CDPATH :: Go on? :: yes\n\n"
        "MESSAGE ERROR GENERAL :: Copier::configure, step 20: error 5030: The program was not run, or it failed.\n"
        "MESSAGE ERROR GENERAL :: Output of setDBMUsingProcess: SQL0000\nMESSAGE ERROR GENERAL :: other\n"
        "MESSAGE INFO UNDOSTART\nMESSAGE INFO UNDOEND\n"
        "PROGRESS TASK START :: INSTALLATION :: 4294967295 :: -1 :: a   :: %s%n%\n"
        "PROGRESS TASK END :: CONFIGURATION :: 5 :: a\n"
        "MESSAGE QUERY CDPATH :: The text of message 0x44000002 is missing. :: \n\n"
        "MESSAGE INFO INSTALLEND :: C:\\Setup Logs\\setup.log\n");
}

TEST(HumanStream, FitsTheTerminal) {
    RuntimeMachine machine;
    URE& engine = machine.engine;
    machine.terminal_.view = {.terminal = true, .redraws = true, .colours = true, .columns = 30};
    machine.terminal_.input = "/media/disc\n\nABORT\n";
    engine.registerObserver(*UREExternalObserverHumanStream::getInstance(engine));
    std::string answer = "unchanged";
    engine.startTask(1, 10, true, "Copying files");
    engine.announceTasks("1,2");
    engine.error(kCodeError, "Copier::copy", 10, kDiskFull);
    EXPECT_EQ(engine.ask(1, kMediumNeededMessage, {}, "D:\\", answer), Response::answered);
    EXPECT_EQ(answer, "/media/disc");
    EXPECT_EQ(engine.ask(2, kMediumNeededMessage, {}, "D:\\", answer), Response::answered);
    EXPECT_EQ(answer, "D:\\");
    machine.terminal_.view.columns = 6;
    machine.say(0x01000005, "abc def abcdef ghi\n\nabcdefgh \xC3\xA4\xC3\xB6\xC3\xBC\xC3\xA4\xC3\xB6\xC3\xBC x");
    machine.terminal_.view.columns = 1;
    machine.say(0x01000005, "a\xE2\x82\xACx");
    machine.terminal_.view.columns = 0;
    EXPECT_EQ(engine.ask(2, kMediumNeededMessage, {}, "D:\\", answer), Response::aborted);
    machine.say(0x01000005, "a text that nobody breaks where there is no width");
    engine.endTask(10, true, "Copying files");
    engine.startTask(1, kUndoTask, true, "");
    EXPECT_EQ(engine.ask(2, kTextMessage, std::array<Insert, 1>{"Sure?"}, "", answer), Response::none);
    const std::string asked = "The installation medium was\nnot found. Where is it? [D:\\]\n(ABORT to stop): \n";
    EXPECT_EQ(machine.console_.error, "Error: Copier::copy, step 10:\nerror 112\n");
    EXPECT_EQ(machine.console_.output,
              "Copying files ...\n" + asked + asked +
                  "abc\ndef\nabcdef\nghi\n\nabcdef\ngh\n\xC3\xA4\xC3\xB6\xC3\xBC\xC3\xA4\xC3\xB6\xC3\xBC\nx\na\n\xE2"
                  "\x82\xAC\nx\n"
                  "The installation medium was not found. Where is it? [D:\\] (ABORT to stop): \n" +
                  "a text that nobody breaks where there is no width\n"
                  "Copying files: done\n"
                  "Undoing what was done ...\n"
                  "Sure? [] (ABORT to stop): \n");
}

TEST(DisplayObserver, ShowsInfosInTheInstaller) {
    RuntimeMachine machine(true);
    URE& engine = machine.engine;
    machine.openLog();
    const Installation at{machine.session, machine.registry_, engine};
    UREDisplayObserverWI display(at);
    engine.registerObserver(display);
    std::string& language = machine.session.properties["KZ7_DEFAULT_LANG"];
    std::string answer = "unchanged";
    language = "en_US";
    machine.session.properties["Secret"] = "hunter2";
    engine.startTask(1, 10, true, "Copying [Secret]");
    engine.endTask(10, true, "Copying");
    engine.trace(kTraceError, "x", 10, kSuccess, "not shown");
    engine.announceTasks("1,2");
    machine.say(0x01000005, "one file");
    machine.session.answer = kBoxAnswerCancel;
    EXPECT_EQ(engine.ask(1, kTextMessage, std::array<Insert, 1>{"Go on?"}, "yes", answer), Response::aborted);
    language = "iw_IL";
    machine.session.answer = kBoxAnswerOk;
    EXPECT_EQ(engine.ask(1, kTextMessage, std::array<Insert, 1>{"Go on?"}, "yes", answer), Response::answered);
    EXPECT_EQ(answer, "yes");
    language = "ar_AA";
    machine.say(0x04000100, "it failed");
    engine.unregisterObserver(display);
    EXPECT_TRUE(machine.logText().ends_with("Note: iMsiGetProperty: KZ7_DEFAULT_LANG, status 0\n"));
    EXPECT_EQ(machine.shownInSession(),
              "8000000||KZ7CustomAction|Copying [Secret]\n"
              "9000000|[1]|one file\n"
              "3000021|[1]\n\n[2]|KZ7 Setup|Go on?\n"
              "3180021|[1]\n\n[2]|KZ7 Setup|Go on?\n"
              "1180010|[1]\n\n[2]|KZ7 Setup|it failed\n");
}

}  // namespace
}  // namespace kz7::test
