// Running a command with its output captured: the command lines, and the results of scripted and real programs.
#include <gtest/gtest.h>

#include "install/platform/memory/process_host.h"
#include "install/platform/memory/small_ports.h"
#include "tests/support/backends.h"
#include "tests/support/captured_run.h"
#include "tests/support/gate.h"

namespace kz7::test {
namespace {

// Programs of a table.
class ScriptedProcess : public testing::Test {
protected:
    ~ScriptedProcess() override { EXPECT_EQ(host_.openHandles() + threads_.openHandles(), 0U); }

    MemoryProcessHost host_;
    MemoryThreads threads_;
    ListedSink sink_;
};

TEST_F(ScriptedProcess, BuildsCommandLines) {
    host_.addProgram(R"(C:\Program Files\x\run.cmd)", {});
    // clang-format off
    const struct { const char* command; const char* built; const char* why; } rows[] = {
        {R"(setup.exe /q)",                        R"("setup.exe" /q)",                         "quoted"},
        {R"(C:\a b\SETUP.EXE /q)",                 R"("C:\a b\SETUP.EXE" /q)",                  "the type in capitals"},
        {R"("C:\a b\setup.exe" /q)",               R"("C:\a b\setup.exe" /q)",                  "quoted already: one pair stays"},
        {R"("C:\a b\setup.exe /q)",                R"("C:\a b\setup.exe" /q)",                  "an opening quote alone is closed"},
        {R"(more.com)",                            R"("more.com")",                             "nothing behind the program"},
        {R"(a.cmd b.exe c)",                       R"("a.cmd b.exe" c)",                        "the order of the types, not of their places"},
        {R"(a.com b.bat c)",                       R"(a.com b.bat c)",                          ".bat before .com"},
        {R"(C:\my.exe d\bin\t.exe -x)",            R"("C:\my.exe" d\bin\t.exe -x)",             "a type inside a folder's name cuts the program there"},
        {R"(C:\Program Files\x\run.cmd arg)",      R"(C:\ProgramFiles\x\run.cmd arg)",          "the short path, unquoted"},
        {R"("C:\Program Files\x\run.cmd" arg)",    R"("C:\Program Files\x\run.cmd" arg)",       "a leading quote is part of what is shortened, in vain"},
        {R"(C:\not there\run.bat arg)",            R"(C:\not there\run.bat arg)",               "no short path to be had"},
        {"C:\\k\\c.exe -p C:\\k\\\n -migratev8 ",  "\"C:\\k\\c.exe\" -p C:\\k\\\n -migratev8 ", "a line feed is part of the arguments"},
        {R"(notepad x)",                           R"(notepad x)",                              "no type: a first command stays as it is"},
        {R"(100%\t.exe %s%n %d)",                  R"("100%\t.exe" %s%n %d)",                   "percent signs are text"},
    };
    // clang-format on
    const auto built = [&](const char* command, bool wrapped = false, bool second = false) {
        return std::string(InstallProcess(host_, threads_, sink_, command, nullptr, wrapped, second).commandLine());
    };
    for (const auto& row : rows) {
        EXPECT_EQ(built(row.command), row.built) << row.why;
    }
    EXPECT_EQ(built(("t.exe " + std::string(1000, 'a')).c_str()), "\"t.exe\" " + std::string(779 - 8, 'a'));
    EXPECT_EQ(built(nullptr), "");
    EXPECT_EQ(built("CATALOG X", true), R"("kz7.exe" -ec -v "CATALOG X")");
    EXPECT_EQ(built("run.cmd x", true, true), R"("kz7.exe" -a -v "run.cmd x")");
    InstallProcess untyped(host_, threads_, sink_, "notepad x");
    untyped.setCommand("notepad x");
    EXPECT_EQ(untyped.commandLine(), "") << "a later command needs its type";
}

TEST_F(ScriptedProcess, CopiesAndPostsTheOutput) {
    host_.addProgram("t.exe", {.output = "five5", .error = std::string("cut\0off", 7), .exitCode = 7});
    InstallProcess process(host_, threads_, sink_, "t.exe %n");
    EXPECT_EQ(process.standardOutputLength(), 0U) << "nothing was collected yet";
    EXPECT_EQ(process.execute(true, true), kSuccess);
    EXPECT_EQ(ending(process, sink_), "0 7 five5|cut") << "a text ends at its first NUL";
    EXPECT_EQ(process.standardOutputLength(), 5U);
    char buffer[] = "######";
    EXPECT_EQ(process.copyStandardOutput(buffer, 0), kBufferTooSmall);
    EXPECT_STREQ(buffer, "######");
    EXPECT_EQ(process.copyStandardOutput(buffer, 5), kBufferTooSmall) << "room for text and terminator is needed";
    EXPECT_STREQ(buffer, "five");
    EXPECT_EQ(process.copyStandardOutput(buffer, 6), kSuccess);
    EXPECT_STREQ(buffer, "five5");
    EXPECT_EQ(process.copyStandardError(buffer, 4), kSuccess);
    EXPECT_STREQ(buffer, "cut");
    process.postOutput("setDBMUsingProcess", 1);
    EXPECT_EQ(sink_.lines,
              "trace 67108865 InstallProcess::execute 10 0 \"t.exe\" %n\n"
              "post 997 67108864 run\npost 999 67108864 run\n"
              "post 997 67108865 setDBMUsingProcess\npost 999 67108865 setDBMUsingProcess\n");
    EXPECT_EQ(host_.started, std::vector<std::string>{"\"t.exe\" %n"});
}

TEST_F(ScriptedProcess, CapturesTextsAroundEachBufferSize) {
    for (const std::size_t length : {0U, 1U, 511U, 512U, 513U, 1024U, 1025U, 2049U, 100000U}) {
        host_.addProgram("t.exe", {.output = std::string(length, 'x')});
        InstallProcess process(host_, threads_, sink_, "t.exe");
        process.execute(true, false);
        sink_.lines.clear();
        EXPECT_TRUE(ending(process, sink_) == "0 0 " + std::string(length, 'x')) << length;
        EXPECT_EQ(sink_.lines.empty(), length == 0) << length;
    }
}

TEST_F(ScriptedProcess, ReportsProgramsThatDidNotStartOrStillRun) {
    InstallProcess process(host_, threads_, sink_, "missing.exe");
    EXPECT_EQ(ending(process, sink_), "5030 5030 ");
    EXPECT_EQ(process.execute(true, false), kSuccess);
    EXPECT_EQ(ending(process, sink_), "5082 5082 ");

    host_.addProgram("t.exe", {.output = "dropped", .exitCode = 4, .runsOn = true});
    process.setCommand(("t.exe " + std::string(772, 'a')).c_str());
    process.execute(true, false);
    EXPECT_EQ(ending(process, sink_), "5082 5082 ") << "a command line of 780 characters would be cut";
    EXPECT_TRUE(host_.started.empty());
    process.setCommand("t.exe");
    EXPECT_EQ(ending(process, sink_), "5030 5030 ") << "another command is another run";
    process.execute(false, false);
    EXPECT_EQ(ending(process, sink_, 100), "0 259 ")
        << "what is read beside the stop flag is dropped, waking bytes and all";
    EXPECT_EQ(ending(process, sink_), "0 4 ") << "it was not killed";
    process.execute(true, false);
    EXPECT_EQ(ending(process, sink_), "0 4 dropped") << "the timeout of the last wait stays: none";
    EXPECT_EQ(ureCreateThread(threads_, sink_, nullptr, nullptr, nullptr), kNullArgument);
}

// Real programs of this machine, and the values of the two slots after them.
class RealProcess : public testing::Test {
protected:
    RealProcess() {
        host_->getSlot(StandardSlot::output, output_);
        host_->getSlot(StandardSlot::error, error_);
    }
    ~RealProcess() override {
        host_->setSlot(StandardSlot::output, output_);
        host_->setSlot(StandardSlot::error, error_);
    }

    InstallProcess make(const std::string& arguments) {
        return InstallProcess(*host_, *threads_, sink_, (childProgram() + " " + arguments).c_str());
    }

    std::unique_ptr<Backend> backend_ = backendNamed("host");
    IProcessHost* host_ = &backend_->platform().processes();
    IThreads* threads_ = &backend_->platform().threads();
    ListedSink sink_;
    StreamHandle output_ = StreamHandle::none;
    StreamHandle error_ = StreamHandle::none;
};

TEST_F(RealProcess, CapturesOutputAndExitCodesAndRestoresBothSlotsThroughOne) {
    Gate gate;
    const std::string flood(kFloodMebibytes << 20, 'x');
    // clang-format off
    const struct { std::string arguments; bool wait; std::string ending; const char* why; } rows[] = {
        {"print said cried 5",            true,  "0 5 said|cried",       "both streams and the exit code"},
        {"print \"\" cried 0",            true,  "0 0 |cried",           "one stream stays empty"},
        {"input",                         true,  "0 0 0 bytes of input", "standard input is empty"},
        {R"(arguments a "b c" "d\"e" f\\g "h\\" %n%s)",
                                          true,  R"(0 0 [a][b c][d"e][f\\g][h\][%n%s])", "arguments arrive as the C runtime splits them"},
        {"arguments a\\\n -m ",           true,  "0 0 [a\\\n][-m]",      "a line feed is no blank"},
        {"flood " + std::to_string(kFloodMebibytes) + " 6",
                                          true,  "0 6 " + flood + "|" + flood, "more than any pipe holds, on both streams"},
        {"leave " + gate.name(),          true,  "0 3 before and after", "read until the last holder of the pipes is gone; the code is the program's"},
        {"close " + gate.name() + " 9",   false, "0 9 ",                 "waited for although it closes its output at once"},
    };
    // clang-format on
    StreamHandle before = StreamHandle::none;
    StreamHandle now = StreamHandle::none;
    for (const auto& row : rows) {
        host_->getSlot(StandardSlot::error, before);
        InstallProcess process = make(row.arguments);
        EXPECT_EQ(process.execute(row.wait, false), kSuccess) << row.why;
        if (row.arguments.find(gate.name()) != std::string::npos) {
            gate.open();
        }
        const std::string ended = ending(process, sink_);
        EXPECT_TRUE(ended == row.ending) << row.why << ": " << ended.substr(0, 100);
        host_->getSlot(StandardSlot::output, now);
        EXPECT_EQ(now, before) << "the slot of standard output holds the old standard error";
        host_->getSlot(StandardSlot::error, now);
        EXPECT_NE(now, error_) << "that of standard error names a closed pipe";
    }
}

TEST_F(RealProcess, AProgramInheritsItsStreamsAndNothingElse) {
    Gate gate;
    OwnedStream reading(*host_);
    OwnedStream writing(*host_);
    ASSERT_EQ(host_->createPipe(reading.receive(), writing.receive()), kSuccess);
    InstallProcess process = make("gate " + gate.name() + " 0");
    process.execute(false, false);
    reading.reset();
    EXPECT_EQ(host_->write(writing.get(), "x"), kPipeClosing) << "nobody reads: it has no read end";
    gate.open();
    EXPECT_EQ(ending(process, sink_), "0 0  and after");
}

TEST_F(RealProcess, ATimeoutStopsTheReadersAndLeavesTheProgram) {
    for (const std::uint32_t timeout : {0U, 1U, 20U}) {
        Gate gate;
        Gate forgotten;
        InstallProcess quiet = make("gate " + gate.name() + " 8");
        quiet.execute(false, false);
        EXPECT_EQ(ending(quiet, sink_, timeout), "0 259 ");

        make("gate " + forgotten.name() + " 0").execute(false, false);
        forgotten.open();
        InstallProcess flood = make("flood 0 0");
        flood.execute(false, false);
        EXPECT_TRUE(ending(flood, sink_, timeout).starts_with("0 ")) << "it may have met its end already";
        EXPECT_EQ((sink_.output + sink_.standardError).find_first_not_of('x'), std::string::npos) << "no waking byte";
        EXPECT_FALSE(ending(flood, sink_).starts_with("0 259 ")) << "nobody reads: its writing ends it";

        gate.open();
        const std::string ended = ending(quiet, sink_);
        EXPECT_TRUE(ended == "0 8 " || ended == "0 141 ") << "it ran to an end of its own: " << ended;
    }
}

}  // namespace
}  // namespace kz7::test
