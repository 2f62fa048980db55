// The tool on stores that are damaged, locked, full or out of reach: it ends with a status and a line that
// names the file, and nothing of what was there is lost.
#include <gtest/gtest.h>
#include <sqlite3.h>
#include <sys/mount.h>
#include <sys/resource.h>

#include <filesystem>
#include <fstream>

#include "install/platform/platform.h"
#include "tests/support/state_directory.h"

namespace kz7::test {
namespace {

const std::vector<std::string> kAddFirst = {"-addKZ7Copy", "FIRST", "C:\\KZ7\\first"};
const std::vector<std::string> kAddSecond = {"-addKZ7Copy", "SECOND", "C:\\KZ7\\second"};

void executeSql(const std::string& path, const char* sql, sqlite3** keep = nullptr) {
    sqlite3* database = nullptr;
    ASSERT_EQ(sqlite3_open(path.c_str(), &database), SQLITE_OK);
    ASSERT_EQ(sqlite3_exec(database, sql, nullptr, nullptr, nullptr), SQLITE_OK) << sqlite3_errmsg(database);
    if (keep != nullptr) {
        *keep = database;
    } else {
        sqlite3_close(database);
    }
}

TEST(StoreFaults, BadStoresEndWithTheirStatusAndOneLineThatNamesTheFile) {
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
        {"written by a newer version", [](const std::string& path) { executeSql(path, "PRAGMA user_version = 2"); },
         kRevisionMismatch, "was written by a newer version of this program"},
        {"a folder in its place", [](const std::string& path) {
             std::filesystem::remove(path);
             std::filesystem::create_directory(path);
         }, kCannotOpen, ""},
    };
    // clang-format on
    for (const auto& row : rows) {
        const StateDirectory state;
        const std::string path = state.file("registry.db");
        ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
        // Leaves the whole store in the one file that is spoiled.
        executeSql(path, "PRAGMA wal_checkpoint(TRUNCATE)");
        row.spoil(path);
        const ProgramResult result = state.tool(kAddSecond);
        EXPECT_EQ(result.exitCode, hostExitCode(row.status)) << row.why;
        EXPECT_NE(result.error.find("kz7InstallReg: " + path + ": " + row.said), std::string::npos) << result.error;
        EXPECT_EQ(result.error.find("kz7InstallReg: "), result.error.rfind("kz7InstallReg: ")) << result.error;
        EXPECT_TRUE(result.error.ends_with(
            ":941: Unable to add a new copy of KZ7 to this machine : rc = " + std::to_string(row.status) + "\n"))
            << result.error;
        EXPECT_EQ(result.output.find("added successfully"), std::string::npos) << row.why;
    }
}

TEST(StoreFaults, AWriterThatStaysIsWaitedForAndThenReported) {
    const StateDirectory state;
    ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
    const std::string before = state.dump();
    sqlite3* writer = nullptr;
    executeSql(state.file("registry.db"), "BEGIN IMMEDIATE", &writer);
    const ProgramResult result = state.tool({"-removeKZ7Copy", "FIRST"});
    sqlite3_close(writer);
    EXPECT_EQ(result.exitCode, hostExitCode(kMissingItem));
    EXPECT_NE(result.error.find("registry.db: stayed locked by another program"), std::string::npos) << result.error;
    EXPECT_EQ(state.dump(), before);

    const std::string below = state.file("registry.db") + "/below";
    const ProgramResult nowhere =
        runProgram({programPath("kz7InstallReg"), "-v8", "C:\\KZ8"}, {{"KZ7_STATE_DIR=" + below}, {}});
    EXPECT_NE(nowhere.exitCode, 0);
    EXPECT_NE(nowhere.error.find("kz7InstallReg: " + below + ": Not a directory\n"), std::string::npos)
        << nowhere.error;
}

// What the run left must be the state before or the one after, and a success must be the one after.
void expectBeforeOrAfter(const StateDirectory& state, const ProgramResult& result, const std::string& before,
                         const std::string& after, const std::string& row) {
    const std::string found = state.dump();
    if (result.exitCode == 0) {
        EXPECT_EQ(found, after) << row;
        EXPECT_NE(result.output.find("added successfully"), std::string::npos) << row;
    } else {
        EXPECT_TRUE(found == before || found == after) << row << "\n" << found;
        EXPECT_FALSE(result.error.empty()) << row;
        EXPECT_EQ(result.signal, 0) << row;
        EXPECT_EQ(result.output.find("added successfully"), std::string::npos) << row;
    }
}

class ScarceResources : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(start_.tool(kAddFirst).exitCode, 0);
        before_ = start_.dump();
        const StateDirectory done;
        done.copyFrom(start_);
        ASSERT_EQ(done.tool(kAddSecond).exitCode, 0);
        after_ = done.dump();
    }

    // Runs the add with a limit; true when it got through.
    bool addUnder(int resource, rlim_t limit, const std::string& row) {
        const StateDirectory state;
        state.copyFrom(start_);
        ProgramOptions options;
        options.inChild = [=] {
            const rlimit both{limit, limit};
            setrlimit(static_cast<__rlimit_resource>(resource), &both);
        };
        const ProgramResult result = state.tool(kAddSecond, options);
        expectBeforeOrAfter(state, result, before_, after_, row);
        EXPECT_EQ(state.integrity(), "ok") << row;
        return result.exitCode == 0;
    }

    StateDirectory start_;
    std::string before_;
    std::string after_;
};

TEST_F(ScarceResources, FileSizesAndDescriptors) {
    const auto through = [&](int resource, rlim_t first, rlim_t last, rlim_t step, const std::string& row) {
        for (rlim_t limit = first; limit <= last; limit += step) {
            if (addUnder(resource, limit, "at most " + std::to_string(limit) + row)) {
                return true;
            }
        }
        return false;
    };
    EXPECT_TRUE(through(RLIMIT_FSIZE, 4096, 256 * 1024, 4096, " bytes in a file"));
    EXPECT_TRUE(through(RLIMIT_NOFILE, 3, 32, 1, " descriptors"));
}

TEST_F(ScarceResources, FullDisk) {
    const TemporaryDirectory mountPoint;
    if (mount("tmpfs", mountPoint.path().c_str(), "tmpfs", 0, "size=128k") != 0) {
        GTEST_SKIP() << "no small file system can be mounted here";
    }
    const std::string store = mountPoint.path() + "/state";
    std::filesystem::copy(start_.path(), store, std::filesystem::copy_options::recursive);
    std::ofstream(mountPoint.path() + "/ballast") << std::string(128 * 1024, 'x');
    ProgramOptions options;
    options.environment = {"KZ7_STATE_DIR=" + store};
    std::vector<std::string> command = kAddSecond;
    command.insert(command.begin(), programPath("kz7InstallReg"));
    const ProgramResult refused = runProgram(command, options);
    std::filesystem::remove(mountPoint.path() + "/ballast");
    const StateDirectory seen;
    std::filesystem::copy(store, seen.path(),
                          std::filesystem::copy_options::recursive | std::filesystem::copy_options::overwrite_existing);
    const ProgramResult done = runProgram(command, options);
    umount(mountPoint.path().c_str());

    EXPECT_EQ(refused.exitCode, hostExitCode(kDiskFull)) << refused.error;
    EXPECT_EQ(seen.dump(), before_);
    EXPECT_EQ(done.exitCode, 0) << done.error;
}

TEST_F(ScarceResources, MemoryAtEveryAllocation) {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    GTEST_SKIP() << "a sanitizer's allocator lets no other be loaded before it";
#endif
    for (const char* forGood : {"0", "1"}) {
        bool through = false;
        for (int count = 1; count < 5000 && !through; ++count) {
            const StateDirectory state;
            state.copyFrom(start_);
            ProgramOptions options;
            options.environment = {"LD_PRELOAD=" + std::string(KZ7_FAILING_MALLOC),
                                   "KZ7_FAIL_ALLOCATION=" + std::to_string(count),
                                   "KZ7_FAIL_FOR_GOOD=" + std::string(forGood)};
            const ProgramResult result = state.tool(kAddSecond, options);
            through = result.exitCode == 0;
            expectBeforeOrAfter(state, result, before_, after_,
                                "allocation " + std::to_string(count) + (*forGood == '1' ? " for good" : ""));
            if (HasFailure()) {
                return;
            }
        }
        EXPECT_TRUE(through);
    }
}

}  // namespace
}  // namespace kz7::test
