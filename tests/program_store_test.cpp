// The tool on stores that are damaged, locked, full or out of reach: it ends with a status and a line that names the
// file, and nothing is lost.
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/mount.h>
#include <sys/stat.h>

#include <filesystem>

#include "install/platform/platform.h"
#include "tests/support/state_directory.h"

namespace kz7::test {
namespace {

// The database remains open; closing null does nothing.
sqlite3* executeSql(const std::string& path, const char* sql) {
    sqlite3* database = nullptr;
    EXPECT_EQ(sqlite3_open(path.c_str(), &database), SQLITE_OK);
    EXPECT_EQ(sqlite3_exec(database, sql, nullptr, nullptr, nullptr), SQLITE_OK) << sqlite3_errmsg(database);
    return database;
}

TEST(StoreFaults, BadStoresEndWithAStatusAndOneLineThatNamesTheFile) {
    // clang-format off
    const struct { const char* why; void (*spoil)(const std::string& path); Status status; const char* said; } rows[] = {
        {"noise over the header", [](const std::string& path) { overwrite(path, std::string(8192, 'x')); },
         kNotRegistryFile, "file is not a database"},
        {"an empty file", [](const std::string& path) { overwrite(path, ""); },
         kNotRegistryFile, "is not a registry store"},
        {"noise over a table", [](const std::string& path) {
             const std::string bytes = contents(path);
             overwrite(path, bytes.substr(0, 4096) + std::string(bytes.size() - 4096, 'x'));
         }, kRegistryCorrupt, "database disk image is malformed"},
        {"written by a newer version", [](const std::string& path) { sqlite3_close(executeSql(path, "PRAGMA user_version = 2")); },
         kRevisionMismatch, "was written by a newer version of this program"},
        {"a folder in its place", [](const std::string& path) {
             std::filesystem::remove(path);
             std::filesystem::create_directory(path);
         }, kCannotOpen, "is not a regular file"},
        {"a pipe in its place", [](const std::string& path) {
             std::filesystem::remove(path);
             mkfifo(path.c_str(), 0600);
         }, kCannotOpen, "is not a regular file"},
        {"a pipe for its journal", [](const std::string& path) { mkfifo((path + "-journal").c_str(), 0600); },
         kCannotOpen, "-journal: is not a regular file"},
        {"a link for its log", [](const std::string& path) {
             std::filesystem::remove(path + "-wal");
             std::filesystem::create_symlink("/dev/zero", path + "-wal");
         }, kCannotOpen, "-wal: is not a regular file"},
    };
    // clang-format on
    const Arguments commands[] = {
        {"-removeKZ7Copy", "FIRST"}, {"-v8", "C:\\KZ8"}, {"-v9", "C:\\KZ9"}, {"-dotnet", "C:\\KZ9"}, kAddSecond};
    for (const auto& row : rows) {
        const StateDirectory state;
        const std::string path = state.file("registry.db");
        ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
        // Moves the whole store to the one file that is damaged.
        sqlite3_close(executeSql(path, "PRAGMA wal_checkpoint(TRUNCATE)"));
        row.spoil(path);
        const std::string said = path + (row.said[0] == '-' ? "" : ": ") + row.said;
        ProgramResult result;
        for (const Arguments& command : commands) {
            result = state.tool(command);
            EXPECT_EQ(result.exitCode, hostExitCode(row.status)) << row.why << " " << command[0];
            EXPECT_NE(result.error.find("kz7InstallReg: " + said), std::string::npos) << result.error;
            EXPECT_EQ(result.error.find("kz7InstallReg: "), result.error.rfind("kz7InstallReg: ")) << result.error;
        }
        EXPECT_TRUE(result.error.ends_with(
            ":941: Unable to add a new copy of KZ7 to this machine : rc = " + std::to_string(row.status) + "\n"))
            << result.error;
        EXPECT_EQ(result.output.find("added successfully"), std::string::npos) << row.why;
        for (const Arguments& command : {Arguments{"copies"},
                                         {"aliases"},
                                         {"check"},
                                         {"resolve", "9"},
                                         {"facts"},
                                         {"report"},
                                         {"repair"},
                                         {"repair", "--check"}}) {
            const ProgramResult refused = state.run("kz7admin", command);
            EXPECT_EQ(refused.error, "kz7admin: " + said + "\n") << row.why << command[0];
            EXPECT_EQ(refused.exitCode, 2) << row.why << command[0];
        }
    }
}

TEST(StoreFaults, ReportsAStoreThatStaysLockedOrCannotBeReached) {
    const StateDirectory state;
    ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
    const std::string before = state.dump();
    sqlite3* writer = executeSql(state.file("registry.db"), "BEGIN IMMEDIATE");
    const ProgramResult result = state.tool({"-removeKZ7Copy", "FIRST"});
    const ProgramResult refused = state.run("kz7admin", {"repair", "--json"});
    for (const char* const command : {"check", "copies", "facts", "report", "repair --check"}) {
        EXPECT_EQ(state.shell(std::string("kz7admin ") + command).exitCode, 0) << command;
    }
    sqlite3_close(writer);
    EXPECT_EQ(refused.error, "{\"schema\":1,\"error\":\"" + state.file("registry.db") +
                                 ": stayed locked by another program for 5 seconds\",\"exitCode\":2,\"status\":170}\n");
    EXPECT_EQ(result.exitCode, hostExitCode(kBusy));
    EXPECT_EQ(result.output, "") << "nobody knows whether the copy is there";
    EXPECT_NE(result.error.find("registry.db: stayed locked by another program"), std::string::npos) << result.error;
    EXPECT_EQ(state.dump(), before);

    const std::string below = state.file("registry.db") + "/below";
    const ProgramResult nowhere =
        runProgram({programPath("kz7InstallReg"), "-v8", "C:\\KZ8"}, {{"KZ7_STATE_DIR=" + below}, {}});
    EXPECT_NE(nowhere.exitCode, 0);
    EXPECT_NE(nowhere.error.find("kz7InstallReg: " + below + ": Not a directory\n"), std::string::npos)
        << nowhere.error;
}

TEST(StoreFaults, ADamagedStoreThatCanBeReadIsAFinding) {
    const StateDirectory state;
    ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
    sqlite3_close(executeSql(state.file("registry.db"),
                             "CREATE TABLE lost (a); INSERT INTO lost VALUES (1); PRAGMA writable_schema = ON;"
                             "DELETE FROM sqlite_schema WHERE name = 'lost'"));
    const ProgramResult check = state.run("kz7admin", {"check"});
    EXPECT_EQ(check.exitCode, 1);
    EXPECT_TRUE(check.output.starts_with("damaged-store: store " + state.file("registry.db") + ": Page ")) << check;
    for (const char* const command : {"facts", "report"}) {
        EXPECT_NE(state.run("kz7admin", {command}).output.find("damaged-store"), std::string::npos) << command;
    }
    EXPECT_EQ(state.run("kz7admin", {"repair"}), (ProgramResult{0, "unchanged\n", ""}));
}

// The keys below a service's key are deleted with it. The tree is deeper than any path and any stack.
TEST(DeepStores, AServiceWithADeepTreeOrACycleBelowIt) {
    const auto deepTree = [](const std::string& fold, int depth) {
        return "INSERT INTO key (parent, fold, name, class) SELECT max(id), 'A', 'A', '' FROM key WHERE fold = '" +
               fold + "'; WITH RECURSIVE n (i) AS (VALUES (1) UNION ALL SELECT i + 1 FROM n WHERE i < " +
               std::to_string(depth) +
               ") INSERT INTO key (parent, fold, name, class) SELECT (SELECT max(id) FROM key) + i - 1, 'A', 'A', ''"
               " FROM n";
    };
    constexpr const char* kCycle =
        "UPDATE key SET parent = (SELECT id FROM key WHERE fold = 'KZ7MGMTSVC_FIRST') WHERE id = 1";
    const StateDirectory state;
    ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
    const StateDirectory cyclic;
    cyclic.copyFrom(state);
    ASSERT_EQ(state.tool({"-removeKZ7Copy", "FIRST"}).exitCode, 0);
    const std::string removed = state.dump();
    ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
    sqlite3_close(executeSql(state.file("registry.db"), deepTree("KZ7MGMTSVC_FIRST", 20000).c_str()));
    const ProgramResult deep = state.tool({"-removeKZ7Copy", "FIRST"});
    EXPECT_EQ(deep.exitCode, 0) << deep.error;
    EXPECT_EQ(state.dump(), removed);

    // The same below a key of the product, with less stack.
    ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
    sqlite3_close(executeSql(state.file("registry.db"), deepTree("GLOBAL_PROFILE", 2000).c_str()));
    const std::string command = "ulimit -s 256; exec " + programPath("kz7InstallReg") + " -removeKZ7Copy FIRST";
    EXPECT_EQ(runProgram({"/bin/bash", "-c", command}, {{"KZ7_STATE_DIR=" + state.path()}, {}}).exitCode, 0);
    EXPECT_EQ(state.dump(), removed);

    sqlite3_close(executeSql(cyclic.file("registry.db"), kCycle));
    const ProgramResult result = cyclic.tool({"-removeKZ7Copy", "FIRST"});
    EXPECT_EQ(result.exitCode, hostExitCode(kRegistryCorrupt));
    EXPECT_NE(result.error.find("registry.db: the keys form a cycle\n"), std::string::npos) << result.error;
}

// The log is written back only while no other program reads. The reader of the pipe adds copies after its first byte.
TEST(SlowReaders, HoldNoTransaction) {
    const std::string program = programPath("kz7admin");
    const std::string adds = " | (head -c 1; for i in $(seq 40); do " + programPath("kz7InstallReg") +
                             " -addKZ7Copy C$i /x; done; cat) >/dev/null";
    const std::string commands[] = {program + " tree" + adds, program + " export" + adds};
    for (const std::string& command : commands) {
        const StateDirectory state;
        overwrite(state.file("large.reg"),
                  "REGEDIT4\n\n[HKEY_USERS\\L]\n\"v\"=\"" + std::string(1 << 19, 'x') + "\"\n");
        ASSERT_EQ(state.run("kz7admin", {"import", state.file("large.reg")}).exitCode, 0);
        runProgram({"/bin/sh", "-c", command}, {{"KZ7_STATE_DIR=" + state.path()}, {}});
        EXPECT_LT(std::filesystem::file_size(state.file("registry.db-wal")), 1U << 19) << command;
    }
}

TEST(StateDirectories, WorkAtAnyLengthAndFromAnyDirectory) {
    const StateDirectory state;
    std::string path = state.path();
    while (path.size() < 1000) {
        path += "/" + std::string(100, 'd');
    }
    const std::string tool = "cd " + state.path() + " && exec " + programPath("kz7InstallReg");
    // The programs that a migration starts run in another directory.
    const ProgramOptions options{
        {"KZ7_STATE_DIR=" + path.substr(state.path().size() + 1), "KZ7_SAMPLE_HOOK=test $KZ7_STATE_DIR = " + path}, {}};
    for (const std::string command : {" -addKZ7Copy FIRST /first", " -dotnet " KZ7_SAMPLE}) {
        const ProgramResult result = runProgram({"/bin/sh", "-c", tool + command}, options);
        EXPECT_EQ(std::to_string(result.exitCode) + result.error, "0") << command;
    }
    EXPECT_NE(StateDirectory::dumpOf(path), "");
}

TEST(ScarceResources, AFullDiskChangesNothing) {
    const StateDirectory start;
    ASSERT_EQ(start.tool(kAddFirst).exitCode, 0);
    const StateDirectory state;
    if (mount("tmpfs", state.path().c_str(), "tmpfs", 0, "size=192k") != 0) {
        GTEST_SKIP() << "no small file system can be mounted here";
    }
    state.copyFrom(start);
    overwrite(state.file("ballast"), std::string(std::size_t{192} * 1024, 'x'));
    const ProgramResult refused = state.tool(kAddSecond);
    std::filesystem::remove(state.file("ballast"));
    const std::string found = state.dump();
    const ProgramResult done = state.tool(kAddSecond);
    umount2(state.path().c_str(), MNT_DETACH);
    EXPECT_EQ(refused.exitCode, hostExitCode(kDiskFull)) << refused.error;
    EXPECT_EQ(refused.error.find("appear later"), std::string::npos) << refused.error;
    EXPECT_EQ(found, start.dump());
    EXPECT_EQ(done.exitCode, 0) << done.error;
}

// The add is in the test of failing calls; these must not crash. The first three hundred allocations are those of
// kz7admin's libraries.
TEST(ScarceResources, NoProgramCrashesWithoutMemory) {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    GTEST_SKIP() << "a sanitizer's library must be the first one that is loaded";
#endif
    const StateDirectory state;
    ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
    const std::string preloaded = "LD_PRELOAD=" + std::string(KZ7_FAILING_CALLS);
    for (const char* forGood : {"KZ7_FAIL_FOR_GOOD=0", "KZ7_FAIL_FOR_GOOD=1"}) {
        for (const Arguments& command : {Arguments{"kz7InstallReg", "-dotnet", KZ7_SAMPLE}, {"kz7admin", "export"}}) {
            for (int count = 300; count < 1200; count += 9) {
                const std::string row = "KZ7_FAIL_AT=" + std::to_string(count);
                const ProgramResult result = state.run(command[0], {command.begin() + 1, command.end()},
                                                       {{preloaded, "KZ7_FAIL_CALL=malloc", row, forGood}, {}});
                EXPECT_GE(result.exitCode, 0) << command[0] << row << result.error;
            }
        }
    }
}

}  // namespace
}  // namespace kz7::test
