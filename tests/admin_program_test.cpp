// kz7admin as a program: its output and exit codes, and that a failure does not change a store.
#include <gtest/gtest.h>
#include <sqlite3.h>

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <functional>

#include "tests/support/state_directory.h"

namespace kz7::test {
namespace {

using namespace std::literals;

constexpr const char* kHead = "Windows Registry Editor Version 5.00\n";

class AdminProgram : public testing::Test {
protected:
    ProgramResult admin(std::vector<std::string> arguments, ProgramOptions options = {}) const {
        return store_.run("kz7admin", std::move(arguments), std::move(options));
    }

    std::string file(const std::string& content) const {
        overwrite(files_.path() + "/file.reg", content);
        return files_.path() + "/file.reg";
    }

    std::string adminError(const std::string& line) const { return "kz7admin: " + line + "\n"; }
    std::string storeLine() const { return adminError("store " + store_.file("registry.db")); }

    StateDirectory store_;
    TemporaryDirectory files_;
};

TEST_F(AdminProgram, MovesWhatTheToolWroteToAnotherStore) {
    ASSERT_EQ(store_.tool({"-addKZ7Copy", "Copy\xE9", "C:\\KZ7\\\x1B[31m"}).exitCode, 0);
    const ProgramResult exported = admin({"export"});
    EXPECT_EQ(exported.exitCode, 0);
    EXPECT_EQ(exported.error, storeLine());
    for (const char* const form : {"", "--utf16"}) {
        const StateDirectory other;
        const ProgramResult moved = store_.shell("kz7admin export "s + form + " | " + programPath("kz7admin") +
                                                 " --store '" + other.path() + "' import -");
        EXPECT_EQ(moved.output, "imported standard input into store " + other.file("registry.db") +
                                    ": 27 keys, 28 values\nchanged: 22 values, 26 keys, 1 service\n");
        EXPECT_EQ(admin({"export", "--store", other.path()}).output, exported.output);
    }
    const ProgramResult key = admin({"export", "\\SOFTWARE\\nvq\\\\KZ7\\InstalledCopies\\Copy\xE9\\global_profile\\"});
    EXPECT_EQ(key.output,
              std::string(kHead) +
                  "\n[HKEY_LOCAL_MACHINE\\SOFTWARE\\nvq\\KZ7\\InstalledCopies\\Copy\xED\xB3\xA9\\GLOBAL_PROFILE]\n"
                  "\"KZ7PATH\"=hex(1):43,00,3a,00,5c,00,4b,00,5a,00,37,00,5c,00,1b,00,5b,00,33,00,31,00,6d,00,\\\n"
                  "  00,00\n");
}

TEST_F(AdminProgram, ShowsForReadingAndForPrograms) {
    const std::string path =
        file(std::string(kHead) +
             "[HKLM\\K]\n;class=\"c\xED\xB0\x9B\"\n@=\"a\\\\b\"\n"
             "\"\xED\xB0\x8A\"=hex(1):1b,00,e9,dc,2e,20,e9,00\n"
             "\"d\"=dword:ff\n\"m\"=hex(7):61,00,00,00,62,00,00,00,00,00\n\"q\"=hex(b):00,00,00,00,01,00,00,00\n"
             "\"z\"=hex(63):01,ff\n[HKLM\\K\\Sub]\n");
    ASSERT_EQ(admin({"import", path}).exitCode, 0);
    EXPECT_EQ(admin({"tree"}), (ProgramResult{0,
                                              R"(HKEY_LOCAL_MACHINE
  K (class "c\x1b")
    @ REG_SZ "a\b"
    "\x0a" REG_SZ "\x1b\xe9\u202e)"
                                              "\xC3\xA9"
                                              R"(" (no NUL terminator)
    "d" REG_DWORD 255 (0xff)
    "m" REG_MULTI_SZ "a" "b" ""
    "q" REG_QWORD 4294967296 (0x100000000)
    "z" type 99 01 ff
    Sub
)",
                                              storeLine()}));
    EXPECT_EQ(admin({"export", "--json", "HKLM\\K"}).output, "{\"schema\":1,\"store\":\"" + store_.file("registry.db") +
                                                                 R"(","keys":[
{"key":"HKEY_LOCAL_MACHINE\\K","class":"c\u001b","values":[
{"name":"","type":1,"bytes":"615c6200","text":"a\\b"},
{"name":"\u000a","type":1,"bytes":"1be9e280aec3a9","text":"\u001b\udce9)"
                                                                 "\xE2\x80\xAE\xC3\xA9"
                                                                 R"("},
{"name":"d","type":4,"bytes":"ff000000","number":255},
{"name":"m","type":7,"bytes":"6100620000"},
{"name":"q","type":11,"bytes":"0000000001000000","number":4294967296},
{"name":"z","type":99,"bytes":"01ff"}]},
{"key":"HKEY_LOCAL_MACHINE\\K\\Sub","class":"","values":[]}]}
)");
}

TEST_F(AdminProgram, ReportsMissingKeysAndFaults) {
    const std::string missing = store_.file("registry.db");
    const std::string bad = file(std::string(kHead) + "[HKLM\\a]\n\"x\"=\"y\"\n[HKLM\\b]\nrubbish\n");
    const std::string unnamable = "HKU\\" + std::string(256, 'x');
    // clang-format off
    const struct { std::vector<std::string> arguments; int exitCode; std::string output; std::string error; } rows[] = {
        {{"tree"},                1, "", adminError("nothing to show: " + missing)},
        {{"export"},              1, kHead, storeLine() + adminError("nothing to show: " + missing)},
        {{"export", "HKU\\x\n"},  1, "", adminError("no such key: HKEY_USERS\\x\\x0a")},
        {{"tree", "HKCU"},        1, "", adminError("no such key: HKEY_CURRENT_USER")},
        {{"tree", unnamable},     2, "", adminError("invalid key name: HKEY_USERS" + unnamable.substr(3))},
        {{"import", bad},         2, "", adminError(bad + ":5: the line is no key, no value and no comment")},
        {{"import", store_.path()}, 2, "", adminError(store_.path() + ": Is a directory")},
        {{"import", "/none/such"},  2, "", adminError("/none/such: No such file or directory")},
        {{},                      2, "", adminError("no command (see --help)")},
        {{"rubbish"},             2, "", adminError("unexpected argument: rubbish (see --help)")},
        {{"export", "--json", "--utf16"}, 2, "", R"x({"schema":1,"error":"--utf16 excludes --json (see --help)","exitCode":2}
)x"},
        {{"--at-least", "1..0", "explain", "0"}, 2, "", adminError("--at-least: not a version: 1..0 (see --help)")},
        {{"tree", "--store="},    2, "", adminError("--store: 1 required TEXT missing (see --help)")},
        {{"copies", "--store", "/dev/null"},  2, "", adminError("/dev/null: Not a directory")},
        {{"aliases", "--store", "/none/such"}, 2, "", adminError("/none/such: No such file or directory")},
        {{"--at-least", "1.0.0.0", "import"}, 2, "", adminError("FILE is required (see --help)")},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(admin(row.arguments), (ProgramResult{row.exitCode, row.output, row.error}));
    }
    EXPECT_NE(access(missing.c_str(), F_OK), 0) << "nothing of all this makes a store";
}

TEST_F(AdminProgram, ReadsAStoreWhoseDirectoryItMayNotWrite) {
    ASSERT_EQ(store_.tool({"-addKZ7Copy", "COPY1", "C:\\KZ7"}).exitCode, 0);
    const std::string whole = admin({"export"}).output;
    for (const char* const name : {"", "registry.db", "registry.db-wal", "registry.db-shm"}) {
        ASSERT_EQ(chmod(store_.file(name).c_str(), 0555), 0);
    }
    const auto asOther = [] { return setuid(geteuid() == 0 ? 65534 : geteuid()) == 0 ? void() : _exit(99); };
    for (const char* const missing : {"-none", "-shm", "-wal"}) {
        unlink(store_.file("registry.db"s + missing).c_str());
        const ProgramResult result = admin({"export"}, {.environment = {}, .inChild = asOther});
        // The whole store is still in its log.
        EXPECT_EQ(result.exitCode, missing == "-wal"s ? 1 : 0) << missing << result.error;
        EXPECT_EQ(result.output == whole, missing != "-wal"s) << missing;
        for (const char* const command : {"check", "facts", "report"}) {
            EXPECT_EQ(admin({command}, {.environment = {}, .inChild = asOther}).exitCode, 0) << command;
        }
    }
    ASSERT_EQ(chmod(store_.file("registry.db").c_str(), 0), 0);
    EXPECT_EQ(admin({"tree"}, {.environment = {}, .inChild = asOther}).error,
              adminError(store_.file("registry.db") + ": Permission denied"));
}

TEST_F(AdminProgram, BacksUpCommittedRunsOnlyWhileAnotherProgramWrites) {
    ASSERT_EQ(store_.tool({"-addKZ7Copy", "COPY1", "C:\\KZ7"}).exitCode, 0);
    const std::string committed = store_.dump();
    sqlite3* writer = nullptr;
    ASSERT_EQ(sqlite3_open(store_.file("registry.db").c_str(), &writer), SQLITE_OK);
    // More than the page cache holds, so that the log has pages of the unfinished run.
    EXPECT_EQ(sqlite3_exec(writer, "PRAGMA cache_size = 1; BEGIN IMMEDIATE; UPDATE value SET data = zeroblob(9999)",
                           nullptr, nullptr, nullptr),
              SQLITE_OK);
    const StateDirectory restored;
    const ProgramResult result = admin({"backup", restored.file("registry.db")});
    sqlite3_close(writer);
    EXPECT_EQ(result.exitCode, 0) << result.error;
    EXPECT_EQ(restored.integrity(), "ok");
    EXPECT_EQ(restored.dump(), committed);
    struct stat found {};
    ASSERT_EQ(stat(restored.file("registry.db").c_str(), &found), 0);
    EXPECT_EQ(found.st_mode & 0777U, 0600U);
}

TEST_F(AdminProgram, BackupReplacesNothingThatItShouldNot) {
    EXPECT_EQ(admin({"backup", files_.path() + "/none"}).error,
              adminError("nothing to back up: " + store_.file("registry.db")));
    std::string big = kHead + "[HKLM\\big]\n"s;
    for (int value = 0; value < 200; ++value) {
        big += "\"" + std::to_string(value) + "\"=\"" + std::string(1000, 'x') + "\"\n";
    }
    ASSERT_EQ(admin({"import", file(big)}).exitCode, 0);
    const std::string before = store_.dump();
    const StateDirectory other;
    ASSERT_EQ(other.tool(kAddFirst).exitCode, 0);
    const std::string link = files_.path() + "/link";
    const std::string old = file("old");
    ASSERT_EQ(symlink(old.c_str(), link.c_str()), 0);
    // clang-format off
    const struct { std::string target; bool force; std::string reason; std::function<void()> inChild; } rows[] = {
        {old,                             false, "file exists (--force replaces it)", {}},
        {old,                             true,  "no space left on device",           limitFileSize(1 << 16)},
        {link,                            true,  "not a regular file",                {}},
        {"/dev/null",                     true,  "not a regular file",                {}},
        {files_.path() + "/",             true,  "not a regular file",                {}},
        {files_.path() + "/none/x",       false, "no such directory",                 {}},
        {files_.path() + "/a\\b",         false, "no file can have this name",        {}},
        {store_.path() + "/registry.db",  true,  "part of a store",                   {}},
        {store_.path() + "/./registry.db-wal", true, "part of a store",               {}},
        {other.file("registry.db"),       true,  "part of a store",                   {}},
        {other.file("registry.db-shm"),   true,  "part of a store",                   {}},
    };
    // clang-format on
    EXPECT_EQ(admin({"backup", ""}).error, adminError("FILE: the name is empty (see --help)"));
    for (const auto& row : rows) {
        const Arguments words = {"backup", row.target, row.force ? "--force" : "--store=" + store_.path()};
        const std::string error = adminError("cannot write backup: " + row.target + ": " + row.reason);
        EXPECT_EQ(admin(words, {{}, row.inChild}), (ProgramResult{2, "", error}));
        EXPECT_EQ(contents(old), "old") << row.target;
        EXPECT_EQ(store_.dump(), before) << row.target;
    }
    const std::filesystem::directory_iterator left(files_.path());
    EXPECT_EQ(std::distance(begin(left), end(left)), 2) << "no temporary file";
}

TEST_F(AdminProgram, FitsTheTerminalAndEscapesControlCharacters) {
    ASSERT_EQ(store_.tool({"-addKZ7Copy", "\xE6\x9D\xB1\xE4\xBA\xAC", "C:\\Program Files\\KZ7"}).exitCode, 0);
    ASSERT_EQ(store_.tool({"-addKZ7Copy", "PLAIN", "C:\\KZ7"}).exitCode, 0);
    ASSERT_EQ(admin({"import", file(kHead + "[HKLM\\a\xC2\x9B]\n"s)}).exitCode, 0);
    const auto onTerminal = [this](const std::string& columns, const std::string& command) {
        const std::string line =
            "stty -opost cols 80; " + columns + ' ' + programPath("kz7admin") + ' ' + command + " 2>/dev/null";
        return runProgram({"/usr/bin/script", "-qec", line, "/dev/null"}, {{"KZ7_STATE_DIR=" + store_.path()}, {}});
    };
    const std::string table = R"(NAME   VIEW  VERSION    VALID  LOCATION              SERVICE
PLAIN  both  9.7.800.0  yes    C:\KZ7                KZ7MGMTSVC_PLAIN stopped
東京   both  9.7.800.0  yes    C:\Program Files\KZ7  KZ7MGMTSVC_東京 stopped
)";
    EXPECT_EQ(onTerminal("", "copies").output, table);
    EXPECT_EQ(admin({"copies"}, {{"COLUMNS=40"}, {}}).output, table) << "nothing is wrapped in a pipe";
    const std::string list = onTerminal("COLUMNS=40", "copies").output;
    EXPECT_EQ(list.substr(0, list.find("\n\n")), R"(NAME      PLAIN
VIEW      both
VERSION   9.7.800.0
VALID     yes
LOCATION  C:\KZ7
SERVICE   KZ7MGMTSVC_PLAIN stopped)");
    EXPECT_NE(onTerminal("", "export 'HKLM\\a\xC2\x9B'").output.find("[HKEY_LOCAL_MACHINE\\a\\u009b]\n"),
              std::string::npos);
    EXPECT_EQ(onTerminal("", "export --utf16").exitCode, 2);
}

TEST_F(AdminProgram, ReportsKeysThatAreListedAndCannotBeRead) {
    ASSERT_EQ(admin({"import", file(kHead + "[HKLM\\a]\n[HKLM\\b]\n"s)}).exitCode, 0);
    sqlite3* store = nullptr;
    ASSERT_EQ(sqlite3_open(store_.file("registry.db").c_str(), &store), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(store, "UPDATE key SET fold = 'AX' WHERE name = 'a'", nullptr, nullptr, nullptr), SQLITE_OK);
    sqlite3_close(store);
    const std::string line = "cannot read key: HKEY_LOCAL_MACHINE\\a: error 2";
    const std::string json = R"({"key":"HKEY_LOCAL_MACHINE\\a","class":"","values":[],"error":2},)";
    const std::string jsonError =
        R"({"schema":1,"error":"cannot read key: HKEY_LOCAL_MACHINE\\a: error 2","exitCode":2})";
    for (const auto& [command, shown] : {std::pair{Arguments{"tree"}, "  a (cannot be read: error 2)\n  b\n"s},
                                         {{"export"}, kHead + "\n[HKEY_LOCAL_MACHINE\\b]\n"s},
                                         {{"export", "--json"}, json}}) {
        const ProgramResult result = admin(command);
        EXPECT_EQ(result.exitCode, 2);
        EXPECT_EQ(result.error, command.size() == 1 ? adminError(line) + storeLine() : jsonError + '\n');
        EXPECT_NE(result.output.find(shown), std::string::npos) << result.output;
    }
}

TEST_F(AdminProgram, KeepsAStoreThatItCannotChange) {
    ASSERT_EQ(store_.tool({"-addKZ7Copy", "COPY1", "C:\\KZ7"}).exitCode, 0);
    const std::string before = store_.dump();
    std::string big = kHead;
    for (int key = 0; key < 2000; ++key) {
        big += "[HKLM\\" + std::to_string(key) + "]\n\"x\"=\"" + std::string(1000, 'x') + "\"\n";
    }
    const ProgramResult full = admin({"import", file(big)}, {{}, limitFileSize(1 << 20)});
    EXPECT_EQ(full.exitCode, 2);
    EXPECT_EQ(full.error.rfind("kz7admin: " + store_.file("registry.db") + ": ", 0), 0U) << full.error;
    EXPECT_EQ(std::count(full.error.begin(), full.error.end(), '\n'), 1) << full.error;
    EXPECT_EQ(store_.dump(), before);

    for (const auto& [command, exitCode, said] :
         {std::tuple{"tree >/dev/full", 2, "error 112"},
          {"copies >&-", 2, "error 29"},
          {"export --utf16 | head -c 1 >/dev/null; exit ${PIPESTATUS[0]}", 0, ""}}) {
        const std::string error = exitCode == 0 ? "" : adminError("cannot write: standard output: "s + said);
        EXPECT_EQ(store_.shell("kz7admin "s + command), (ProgramResult{exitCode, "", storeLine() + error}));
    }

    overwrite(store_.file("registry.db"), "rubbish");
    for (const char* const command : {"tree", "import"}) {
        EXPECT_EQ(admin({command, "import"s == command ? file(kHead + "[HKLM\\a]\n"s) : "HKLM"s}),
                  (ProgramResult{2, "", adminError(store_.file("registry.db") + ": file is not a database")}));
    }
}

}  // namespace
}  // namespace kz7::test
