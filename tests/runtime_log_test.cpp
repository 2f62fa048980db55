// The log of a run: exact files with a fixed clock, the session's log, and failures.
#include <gtest/gtest.h>

#include <sstream>

#include "tests/support/runtime_machine.h"

namespace kz7::test {
namespace {

const std::string kLine60 = "============================================================\n";

TEST(LogFile, ContainsAWholeRunExactly) {
    RuntimeMachine machine;
    machine.engine.mode = kModeInstall;
    machine.host_.installed.name = "\"Linux\"";
    machine.openLog();
    URELogObserver& log = machine.log();
    machine.engine.startTask(1, 10, true, "Copying files");
    machine.engine.endTask(10, true, "");
    machine.engine.trace(kTraceError, "iMsiSetProperty", 10, kSuccess, "BASE_CLIENT_BIN_SELECTED");
    machine.engine.error(kCodeError, "Copier::copy", 20, kDiskFull);
    machine.engine.error(kCodeWarning, "Copier::copy", 30, kSuccess);
    log.writeFunction("an error in words");
    machine.say(0x4000000, "a report without a time");
    machine.say(0x1000005, "\"quoted\"");
    machine.say(0x4000001, "\"");
    machine.say(0x1000005, "");
    machine.engine.message(0x4000100, 12345, {});
    EXPECT_EQ(log.writeHeader(true), kSuccess);
    EXPECT_EQ(machine.logText(), "\nInstallation started: Tue Jan  2 03:04:05 2024 UTC\n" + kLine60 +
                                     "Linux 1.0\n"
                                     "Copying files\n"
                                     "Note: iMsiSetProperty, step 10: BASE_CLIENT_BIN_SELECTED\n"
                                     "ERROR: Copier::copy, step 20: error 112\n"
                                     "WARNING: Copier::copy, step 30\n"
                                     "03:04:05writeFunction, step 10: an error in words\n"
                                     "a report without a time\n"
                                     "quoted\n"
                                     "Note: \"\n"
                                     "\n"
                                     "ERROR: The text of message 0x4000100 is missing.\n"
                                     "\nInstallation ended: Tue Jan  2 03:04:05 2024 UTC\n" +
                                     kLine60);
    EXPECT_TRUE(machine.processes_.started.empty());
    EXPECT_EQ(log.logFilePath(), "C:\\Setup Logs\\setup.log");
    char path[kPathBytes];
    EXPECT_EQ(log.componentLogPath(path), path);
    EXPECT_STREQ(path, "C:\\SetupLogs\\kz7msi.log");
    EXPECT_STREQ(log.componentLogPath(nullptr), path);
    for (const std::size_t length : {255U, 256U, 257U, 512U, 5000U, 100U << 20}) {
        const std::string line = machine.logged([&] { machine.say(0x4000001, std::string(length, 'x')); });
        EXPECT_TRUE(line == "Note: " + std::string(length, 'x') + "\n") << length << " " << line.size();
    }
}

TEST(LogFile, BeginsWithTheSystemAndATitleOfTheModeAndTheCatalogue) {
    // clang-format off
    const struct { const char* why; std::uint32_t mode; const char* catalogue; bool isEnd; std::string title; } rows[] = {
        {"another bit",             8,       "",                              true,  ""},
        {"the first bit in order",  0x17,    "",                              false, "Installation started: "},
        {"update",                  0x12,    "",                              false, "Update started: "},
        {"removal",                 0x14,    "",                              true,  "Removal ended: "},
        {"configuration",           0x10,    "",                              true,  "Configuration ended: "},
        {"quoted in the text",      1,       "2000 = \"\"\"Anfang \"\"\"",     false, "Anfang "},
        {"44 characters",           1,       "2000 = aaaaaaaaaabbbbbbbbbbccccccccccddddddddddeeeeeeeeee", false, "aaaaaaaaaabbbbbbbbbbccccccccccddddddddddeeee"},
    };
    // clang-format on
    const std::string cut(79, 'x');
    RuntimeMachine machine;
    machine.host_.installed = {cut, cut + "x", cut + "x"};
    machine.openLog();
    EXPECT_EQ(machine.logText(), "\nTue Jan  2 03:04:05 2024 UTC\n" + kLine60 + cut + " " + cut + "." + cut + "\n");
    machine.host_.dateAndZone = std::string(50, '9');
    for (const auto& row : rows) {
        ResponseFault fault;
        EXPECT_EQ(machine.engine.messages.load(row.catalogue, fault), kSuccess) << row.why;
        machine.engine.mode = row.mode;
        const std::string header = machine.logged([&] { machine.log().writeHeader(row.isEnd); });
        EXPECT_EQ(header, "\n" + row.title + std::string(42, '9') + "\n" + kLine60) << row.why;
    }
}

TEST(LogFile, IsReplacedByTheSessionIfItCannotBeOpened) {
    const std::string onlyNotes = "in the session, [Secret] [1] ][\na note\n";
    const std::string all = "in the session, [Secret] [1] ][\nNote: a note\nERROR: an error\na task\n";
    const std::string header = "\nTue Jan  2 03:04:05 2024 UTC\n" + kLine60 + "Memory 1.0\n";
    const std::string report = "ERROR: URELogObserver::setLogFile, step 10: error ";
    // clang-format off
    const struct { const char* why; std::string path; std::string expected; } rows[] = {
        {"no folder in the path",     "setup.log",                                onlyNotes},
        {"no path",                   "",                                         onlyNotes},
        {"no short form",             "C:\\absent\\setup.log",                    onlyNotes},
        {"the folder went away",      "C:\\Gone\\setup.log",                      report + "3\n" + header + all},
        {"a path that does not fit",  "C:\\Setup Logs\\" + std::string(300, 'x'), report + "206\n" + header + all},
    };
    // clang-format on
    for (const auto& row : rows) {
        RuntimeMachine machine(true);
        machine.processes_.addProgram("C:\\Gone\\", {});
        machine.session.properties["Secret"] = "hunter2";
        machine.engine.registerObserver(machine.log(), Takes::everything);
        machine.log().setLogFile(row.path);
        EXPECT_EQ(machine.log().writeLine("in the session, [Secret] [1] ]["), kSuccess);
        machine.say(0x4000001, "\"a note\"");
        machine.say(0x4000100, "an error");
        machine.engine.startTask(1, 1, true, "a task");
        std::istringstream expected(row.expected);
        std::string shown;
        for (std::string line; std::getline(expected, line);) {
            shown += "4000000||" + line + "\n";
        }
        EXPECT_EQ(machine.shownInSession(), shown) << row.why;
        EXPECT_EQ(machine.logText(), "") << row.why;
    }
    RuntimeMachine machine;
    EXPECT_EQ(machine.log().writeLine("nowhere"), kNoInstallerSession);
}

TEST(LogFile, ReportsShortWrites) {
    // clang-format off
    const struct { std::uint64_t room; Status line; Status header; } rows[] = {
        {1000, kSuccess, kSuccess}, {6, kSuccess, kFailed}, {5, 5, kFailed}, {1, 1, kFailed}, {0, kFailed, kFailed},
        {6 + 1 + 29 + 60, kSuccess, 60}, {6 + 1 + 29 + 61, kSuccess, kSuccess},
    };
    // clang-format on
    for (const auto& row : rows) {
        RuntimeMachine machine;
        machine.openLog();
        machine.files_.room = row.room;
        EXPECT_EQ(machine.log().writeLine("12345"), row.line) << row.room;
        EXPECT_EQ(machine.log().writeHeader(true), row.header) << row.room;
        machine.files_.room = 1000;
        EXPECT_EQ(machine.log().writeLine("there is room again"), kSuccess);
    }
}

}  // namespace
}  // namespace kz7::test
