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

std::string contents(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void overwrite(const std::string& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary | std::ios::trunc) << bytes;
}

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

struct BadStore {
    const char* why;
    void (*spoil)(const StateDirectory&);
    Status status;
    const char* said;
};

const BadStore kBadStores[] = {
    {"noise over the header",
     [](const StateDirectory& state) { overwrite(state.file("registry.db"), std::string(8192, 'x')); },
     kNotRegistryFile, "registry.db: file is not a database"},
    {"an empty file", [](const StateDirectory& state) { overwrite(state.file("registry.db"), ""); }, kNotRegistryFile,
     "registry.db: is not a registry store"},
    {"noise over a table",
     [](const StateDirectory& state) {
         std::string bytes = contents(state.file("registry.db"));
         bytes.replace(4096, bytes.size() - 4096, bytes.size() - 4096, 'x');
         std::filesystem::remove(state.file("registry.db-wal"));
         overwrite(state.file("registry.db"), bytes);
     },
     kRegistryCorrupt, "registry.db: database disk image is malformed"},
    {"written by a newer version",
     [](const StateDirectory& state) { executeSql(state.file("registry.db"), "PRAGMA user_version = 2"); },
     kRevisionMismatch, "registry.db: was written by a newer version of this program"},
    {"a folder in its place",
     [](const StateDirectory& state) {
         std::filesystem::remove(state.file("registry.db"));
         std::filesystem::create_directory(state.file("registry.db"));
     },
     kCannotOpen, "registry.db: "},
};

class BadStores : public testing::TestWithParam<BadStore> {};

TEST_P(BadStores, EndWithTheirStatusAndOneLineThatNamesTheFile) {
    const BadStore& row = GetParam();
    const StateDirectory state;
    ASSERT_EQ(state.tool(kAddFirst).exitCode, 0);
    // Leaves the whole store in the one file that is spoiled.
    executeSql(state.file("registry.db"), "PRAGMA wal_checkpoint(TRUNCATE)");
    row.spoil(state);

    const ProgramResult result = state.tool(kAddSecond);

    EXPECT_EQ(result.exitCode, hostExitCode(row.status)) << row.why;
    EXPECT_NE(result.error.find(row.said), std::string::npos) << row.why << "\n" << result.error;
    EXPECT_NE(result.error.find(
                  ":941: Unable to add a new copy of KZ7 to this machine : rc = " + std::to_string(row.status) + "\n"),
              std::string::npos)
        << result.error;
    EXPECT_EQ(result.output.find("added successfully"), std::string::npos);
    std::size_t told = 0;
    for (std::size_t at = 0; (at = result.error.find("kz7InstallReg: ", at)) != std::string::npos; ++at) {
        ++told;
    }
    EXPECT_EQ(told, 1U) << result.error;
}

INSTANTIATE_TEST_SUITE_P(Rows, BadStores, testing::ValuesIn(kBadStores));

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
}

TEST(StoreFaults, AStateDirectoryThatCannotBeMadeIsNamed) {
    const TemporaryDirectory scratch;
    overwrite(scratch.path() + "/file", "");
    ProgramOptions options;
    options.environment = {"KZ7_STATE_DIR=" + scratch.path() + "/file/below"};
    const ProgramResult result = runProgram({programPath("kz7InstallReg"), "-addKZ7Copy", "FIRST", "C:\\KZ7"}, options);
    EXPECT_NE(result.exitCode, 0);
    EXPECT_NE(result.error.find("kz7InstallReg: " + scratch.path() + "/file/below: Not a directory\n"),
              std::string::npos)
        << result.error;
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

TEST_F(ScarceResources, FileSizeLimit) {
    bool through = false;
    for (rlim_t kib = 4; kib <= 256 && !through; kib += 4) {
        through = addUnder(RLIMIT_FSIZE, kib * 1024, "files of at most " + std::to_string(kib) + " KiB");
    }
    EXPECT_TRUE(through);
}

TEST_F(ScarceResources, Descriptors) {
    bool through = false;
    for (rlim_t count = 3; count <= 32 && !through; ++count) {
        through = addUnder(RLIMIT_NOFILE, count, "at most " + std::to_string(count) + " descriptors");
    }
    EXPECT_TRUE(through);
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
