// What a front end is told and answers: single lines, the queue, whole runs to the byte, and what goes wrong.
#include <gtest/gtest.h>

#include <array>
#include <cstdlib>
#include <new>
#include <string>

#include "install/platform/faulty/console.h"
#include "install/runtime/observers/display_observer.h"
#include "install/runtime/observers/external_output_pipe.h"
#include "install/runtime/observers/protocol_lines.h"
#include "tests/support/backends.h"
#include "tests/support/runtime_machine.h"

namespace kz7::test {
namespace {

int allocationsUntilFailure = -1;  // of those that answer null; below 0 none fails
std::uint64_t allocations = 0;

}  // namespace
}  // namespace kz7::test

// Not inlined: gcc would take the pair below for a mismatch.
[[gnu::noinline]] void* operator new(std::size_t size) {
    ++kz7::test::allocations;
    void* const memory = std::malloc(size == 0 ? 1 : size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}

[[gnu::noinline]] void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    return std::malloc(size == 0 ? 1 : size);
}

[[gnu::noinline]] void operator delete(void* memory) noexcept {
    std::free(memory);
}

[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}

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

TEST(ProtocolLines, TellTasks) {
    constexpr auto kStart = ProgressKind::start;
    constexpr auto kEnd = ProgressKind::end;
    // clang-format off
    const struct { const char* why; ProgressKind kind; std::uint64_t start; std::int32_t task; bool installation;
                   std::string text; std::string line; } rows[] = {
        {"installation",           kStart, 40, 10, true,  "Files", "PROGRESS TASK START :: INSTALLATION :: 40 :: 10 :: Files\n"},
        {"configuration",          kStart, 0, -1,  false, "",      "PROGRESS TASK START :: CONFIGURATION :: 0 :: -1 :: \n"},
        {"low 32 bits, unsigned",  kStart, 0x1FFFFFFFF, 1, true, "x", "PROGRESS TASK START :: INSTALLATION :: 4294967295 :: 1 :: x\n"},
        {"an end, no start value", kEnd, 7, 10, true,     "Files", "PROGRESS TASK END :: INSTALLATION :: 10 :: Files\n"},
        {"an end, configuration",  kEnd, 7, 11, false,    "x",     "PROGRESS TASK END :: CONFIGURATION :: 11 :: x\n"},
        {"undo",                   kStart, 1, 3577, true, "x",     "MESSAGE INFO UNDOSTART\n"},
        {"undo, the other flag",   kStart, 1, 3577, false, "x",    "MESSAGE INFO UNDOSTART\n"},
        {"undo ends",              kEnd, 1, 3577, false,  "x",     "MESSAGE INFO UNDOEND\n"},
        {"another event",          ProgressKind{0x300}, 1, 1, true, "x", ""},
        {"a separator in a text",  kEnd, 0, 1, true,      "a :: b", "PROGRESS TASK END :: INSTALLATION :: 1 :: a :: b\n"},
        {"line ends in a text",    kEnd, 0, 1, true,      "a\r\nMESSAGE", "PROGRESS TASK END :: INSTALLATION :: 1 :: a  MESSAGE\n"},
        {"a NUL in a text",        kEnd, 0, 1, true,      std::string("a\0b", 3), "PROGRESS TASK END :: INSTALLATION :: 1 :: a\n"},
        {"placeholders in a text", kEnd, 0, 1, true,      "%s%n%%", "PROGRESS TASK END :: INSTALLATION :: 1 :: %s%n%%\n"},
    };
    // clang-format on
    for (const auto& row : rows) {
        ProtocolLine line;
        EXPECT_EQ(progressLine({row.kind, row.start, row.task, row.installation, row.text}, line), !row.line.empty())
            << row.why;
        EXPECT_EQ(line.view(), row.line) << row.why;
    }
    ProtocolLine line;
    progressLine({kEnd, 0, 1, true, std::string(5000, 'x')}, line);
    EXPECT_EQ(line.view().size(), 1023U);
    EXPECT_EQ(line.view().substr(1020), "xx\n") << "a line that is too long keeps its line feed";
    EXPECT_EQ(queryLine(std::string(3000, 'a'), "b").view().substr(1020), "aa\n");
    EXPECT_EQ(installEndLine("\\var\\log\\x.log").view(), "MESSAGE INFO INSTALLEND :: \\var\\log\\x.log\n");
}

TEST(ProtocolLines, TellTaskLists) {
    const std::string twenty = "12345678901234567890";
    // clang-format off
    const struct { const char* why; std::string list; int count; std::string identifiers; std::string times; } rows[] = {
        {"two",                          "10,30;11,45",     2, " :: 10 :: 11",     " :: 30 :: 45"},
        {"an end mark adds none",        "10,30;11,45;",    2, " :: 10 :: 11",     " :: 30 :: 45"},
        {"nothing",                      "",                0, "",                 ""},
        {"a missing time",               "10;11,5",         2, " :: 10 :: 11",     " ::  :: 5"},
        {"a missing identifier",         ",30",             1, " :: ",             " :: 30"},
        {"an empty entry",               "1,2;;3,4",        3, " :: 1 ::  :: 3",   " :: 2 ::  :: 4"},
        {"more commas",                  "1,2,3",           1, " :: 1",            " :: 2,3"},
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
    constexpr auto kIgnored = AnswerLine::ignored;
    constexpr auto kAbort = AnswerLine::abort;
    constexpr auto kResponse = AnswerLine::response;
    // clang-format off
    const struct { const char* line; AnswerLine answer; } rows[] = {
        {"ABORT", kAbort},           {"ABORTED", kAbort},         {"ABOR", kIgnored},         {"abort", kIgnored},
        {" ABORT", kIgnored},        {"", kIgnored},              {"RESPONSE", kIgnored},     {"RESPONSE:", kIgnored},
        {"RESPONSE:::", kIgnored},   {"RESPONSEX", kIgnored},     {"RESPONSE 5", kIgnored},   {"response :: E", kIgnored},
        {"RESPONSE :: E", kResponse},{"RESPONSE::E", kResponse},  {"RESPONSE: ", kResponse},  {"RESPONSEX:E", kResponse},
        {"RESPONS:E", kIgnored},     {":RESPONSE:E", kIgnored},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(parseAnswer(row.line), row.answer) << row.line;
    }
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

    // clang-format off
    const struct { const char* text; const char* written; } formats[] = {
        {"100%%", "100%"}, {"%%%", "%%"}, {"%%%%", "%%"}, {"%", "%"}, {"a%s%n%5d%%b", "a%s%n%5d%b"}, {"", ""},
    };
    // clang-format on
    for (const auto& row : formats) {
        machine.console_.output.clear();
        pipe.writeMessage(row.text);
        EXPECT_EQ(machine.console_.output, row.written) << row.text;
    }
    pipe.writeMessage(nullptr);
}

TEST(Pipe, ReadsAnswerLines) {
    const std::string large(1 << 20, 'x');
    // clang-format off
    const struct { const char* why; std::string input; std::vector<std::string> lines; } rows[] = {
        {"lines",                           "one\ntwo\n",                {"one", "two"}},
        {"no line end",                     "one",                       {"one"}},
        {"carriage returns",                "one\r\ntwo\rx\r\n",         {"one", "two\rx"}},
        {"nothing",                         "",                          {}},
        {"an empty line",                   "\n",                        {""}},
        {"the rest of a long line is lost", "123456789\nnext\n",         {"1234567", "next"}},
        {"a line of 1 MiB",                 large + "\nABORT\n",         {"xxxxxxx", "ABORT"}},
        {"a NUL ends the text",             std::string("a\0b\nc\n", 6), {"a", "c"}},
    };
    // clang-format on
    for (const auto& row : rows) {
        RuntimeMachine machine;
        machine.lines_.input = row.input;
        UREExternalOutputPipe pipe(machine.console_, machine.lines_, machine.engine);
        std::vector<std::string> lines;
        char buffer[8];
        while (pipe.readResponse(buffer, sizeof buffer) == kSuccess) {
            lines.emplace_back(buffer);
        }
        EXPECT_EQ(lines, row.lines) << row.why;
    }
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
    engine.endTask(kUndoTask, true, "undo");
    responses.push_back(engine.ask(2, 1, {}, "", answer));
    EXPECT_EQ(answer, "");
}

constexpr const char* kMachineRun =
    "MESSAGE INFO INSTALLSTART\n"
    "PROGRESS INFO TASKCOUNT :: 2\n"
    "PROGRESS INFO TASKIDS :: 10 :: 11\n"
    "PROGRESS INFO TASKTIMES :: 30 :: 45\n"
    "PROGRESS TASK START :: INSTALLATION :: 40 :: 10 :: Copying files\n"
    "MESSAGE ERROR CDNOTFOUND :: Install CD not found\n"
    "MESSAGE QUERY CDPATH :: The installation medium was not found. Where is it? :: D:\\\n"
    "\n"
    "PROGRESS TASK END :: INSTALLATION :: 10 :: Copying files\n"
    "PROGRESS TASK START :: CONFIGURATION :: 5 :: 11 :: 100% of the configuration\n"
    "MESSAGE QUERY CDPATH :: Go on? :: yes\n"
    "\n"
    "MESSAGE ERROR GENERAL :: Copier::configure, step 20: error 5030: The program was not run, or it failed.\n"
    "MESSAGE ERROR GENERAL :: The program wrote: SQL0000\n"
    "MESSAGE ERROR GENERAL :: other\n"
    "MESSAGE INFO UNDOSTART\n"
    "MESSAGE INFO UNDOEND\n"
    "MESSAGE QUERY CDPATH :: The text of message 0x44000002 is missing. :: \n"
    "\n"
    "MESSAGE INFO INSTALLEND :: C:\\Setup Logs\\setup.log\n";

constexpr const char* kRunInLog =
    "Tasks: 10,30;11,45;\n"
    "Copying files\n"
    "Note: Copier::copy, step 10: 42 files\n"
    "Note: The installation medium was not found. Where is it?\n"
    "Copying files\n"
    "100%% of the\nconfiguration\n"
    "Go on?\n"
    "ERROR: Copier::configure, step 20: error 5030: The program was not run, or it failed.\n"
    "Note: The program wrote: SQL0000\n"
    "Note: other\n"
    "not for front ends\n"
    "undo\n"
    "undo\n"
    "WARNING: The text of message 0x44000002 is missing.\n";

TEST(MachineStream, TellsAWholeRunToTheByte) {
    using Response = UREInfo::Response;
    RuntimeMachine machine;
    machine.lines_.input = "RESPONSE :: E\r\nsomething else\nABORT\n";
    machine.openLog();
    const std::size_t before = machine.logText().size();
    auto* stream = UREExternalObserverMachineStream::getInstance(machine.engine);
    EXPECT_EQ(UREExternalObserverMachineStream::getInstance(machine.engine), stream);
    EXPECT_TRUE(machine.lines_.keepsLineFeeds);
    machine.engine.registerObserver(*stream);
    std::vector<Response> responses;
    runInstallation(machine.engine, responses);
    machine.engine.unregisterObserver(*stream);
    UREExternalObserverMachineStream::release();
    EXPECT_FALSE(machine.lines_.keepsLineFeeds);
    EXPECT_EQ(responses, (std::vector{Response::answered, Response::none, Response::aborted}));
    EXPECT_EQ(machine.console_.output, kMachineRun);
    EXPECT_EQ(machine.console_.flushed, machine.console_.output.size());
    EXPECT_EQ(machine.logText().substr(before), kRunInLog);
}

// An engine whose console goes through a fault.
TEST(MachineStream, AFrontEndThatIsGoneStopsNothing) {
    RuntimeMachine machine;
    FaultCounter faults(5, true, kWriteFault);
    FaultyConsole console(machine.console_, faults);
    RuntimePorts ports{machine.files_,    machine.processes_, machine.threads_,  console, machine.lines_,
                       machine.terminal_, machine.clock_,     machine.identity_, nullptr};
    URE engine(ports);
    URELogObserver& log = *URELogObserver::getInstance(engine);
    log.setLogFile(RuntimeMachine::kLogFile);
    engine.registerObserver(log, Takes::everything);
    const std::size_t before = machine.logText().size();
    auto* stream = UREExternalObserverMachineStream::getInstance(engine);
    engine.registerObserver(*stream);
    std::vector<UREInfo::Response> responses;
    std::string answer = "unchanged";
    engine.startTask(1, 1, true, "a");
    engine.startTask(1, 2, true, "b");
    EXPECT_EQ(engine.ask(1, kMediumNeededMessage, {}, "", answer), UREInfo::Response::none);
    engine.endTask(2, true, "b");
    engine.unregisterObserver(*stream);
    UREExternalObserverMachineStream::release();
    URELogObserver::release();
    EXPECT_EQ(machine.logText().substr(before), "a\nb\nNote: The installation medium was not found. Where is it?\nb\n");
}

TEST(MachineStream, AllocationFailuresAreReportedOnceAndLoseOneLine) {
    const std::string constructor = "ERROR: UREExternalOutputPipe::UREExternalOutputPipe, step ";
    const std::string add = "ERROR: UREExternalOutputPipe::addQueueMessage, step ";
    const std::string reason = ": error 5002: There is not enough memory.\n";
    // The queue is made of an array and 4 buffers; the fifth line asks for an array and 4 buffers more.
    for (int failing = 0; failing < 11; ++failing) {
        RuntimeMachine machine;
        machine.openLog();
        const std::size_t before = machine.logText().size();
        allocationsUntilFailure = failing;
        auto* stream = UREExternalObserverMachineStream::getInstance(machine.engine);
        machine.engine.registerObserver(*stream);
        // 5 lines at once: count, identifiers, line feed, times, line feed.
        machine.engine.announceTasks("1,2");
        machine.engine.startTask(1, 1, true, "a");
        allocationsUntilFailure = -1;
        machine.engine.endTask(1, true, "a");
        machine.engine.unregisterObserver(*stream);
        UREExternalObserverMachineStream::release();

        const std::string list =
            "PROGRESS INFO TASKCOUNT :: 1\nPROGRESS INFO TASKIDS :: 1\nPROGRESS INFO TASKTIMES :: 2";
        const std::string tasks =
            "PROGRESS TASK START :: INSTALLATION :: 1 :: 1 :: a\nPROGRESS TASK END :: INSTALLATION :: 1 :: a\n";
        std::string lines = list + "\n" + tasks;
        std::string log = "Tasks: 1,2\na\na\n";
        if (failing < 5) {
            lines.clear();
            log = constructor + (failing == 0 ? "10" : "20") + reason;
            // Nothing of it is ever queued: each of the 7 lines is reported.
            const std::string lost = add + "10" + reason;
            log += "Tasks: 1,2\n" + lost + lost + lost + lost + lost + "a\n" + lost + "a\n" + lost;
        } else if (failing < 10) {
            // The list is not flushed: what of it was kept goes out later.
            lines = list;
            log = "Tasks: 1,2\n" + add + (failing == 5 ? "10" : "20") + reason + "a\na\n";
            lines += tasks;
        }
        EXPECT_EQ(machine.console_.output,
                  "MESSAGE INFO INSTALLSTART\n" + lines + "MESSAGE INFO INSTALLEND :: C:\\Setup Logs\\setup.log\n")
            << "allocation " << failing;
        EXPECT_EQ(machine.logText().substr(before), log) << "allocation " << failing;
    }
}

TEST(Observers, TakeInfosWithoutAnAllocation) {
    const std::unique_ptr<Backend> backend = backendNamed("host");
    URE engine(portsOf(backend->platform()));
    URELogObserver& log = *URELogObserver::getInstance(engine);
    log.setLogFile(backend->folder() + "\\kz7msi.log");
    std::uint64_t made = 0;
    backend->written(false, [&](IConsole&) {
        auto* machine = UREExternalObserverMachineStream::getInstance(engine);
        auto* human = UREExternalObserverHumanStream::getInstance(engine);
        engine.registerObserver(log, Takes::everything);
        engine.registerObserver(*machine);
        engine.registerObserver(*human);
        for (int round = 0; round < 2; ++round) {
            made = allocations;
            for (int i = 0; i < 100; ++i) {
                engine.startTask(1, i, true, "Copying a file with a name of a usual length");
                engine.error(kCodeError, "Copier::copy", 10, kNotExecuted);
                log.writeFunction("an error in words");
                engine.endTask(i, true, "Copying a file with a name of a usual length");
            }
            made = allocations - made;
        }
        engine.unregisterObserver(*human);
        engine.unregisterObserver(*machine);
        UREExternalObserverHumanStream::release();
        UREExternalObserverMachineStream::release();
    });
    URELogObserver::release();
    EXPECT_EQ(made, 0U);
}

TEST(HumanStream, IsReadableAndAsWideAsTheTerminal) {
    RuntimeMachine machine;
    machine.terminal_.view = {.terminal = true, .redraws = true, .colours = true, .columns = 30};
    machine.lines_.input = "/media/disc\n\nABORT\n";
    auto* stream = UREExternalObserverHumanStream::getInstance(machine.engine);
    machine.engine.registerObserver(*stream);
    std::string answer = "unchanged";
    using Response = UREInfo::Response;
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
    machine.engine.unregisterObserver(*stream);
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
    const struct { const char* why; std::string text; std::uint32_t columns; std::vector<std::string> lines; } rows[] = {
        {"fits",                     "abc def",        7, {"abc def"}},
        {"breaks at a blank",        "abc def",        6, {"abc", "def"}},
        {"a blank at the edge",      "abcdef ghi",     6, {"abcdef", "ghi"}},
        {"a long word",              "abcdefgh",       3, {"abc", "def", "gh"}},
        {"line feeds",               "a\n\nb",         5, {"a", "", "b"}},
        {"no width",                 "abc def",        0, {"abc def"}},
        {"one column",               "ab c",           1, {"a", "b", "c"}},
        {"characters, not bytes",    "\xC3\xA4\xC3\xB6\xC3\xBC x", 3, {"\xC3\xA4\xC3\xB6\xC3\xBC", "x"}},
    };
    // clang-format on
    for (const auto& row : rows) {
        std::string_view rest = row.text;
        std::vector<std::string> lines;
        while (!rest.empty()) {
            lines.emplace_back(takeWrappedLine(rest, row.columns));
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
    EXPECT_EQ(machine.session.openHandles(), 0U);
}

}  // namespace
}  // namespace kz7::test
