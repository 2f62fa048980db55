// What the embedded store guarantees beyond the contract of the port: transactions, other processes, faults.
#include "install/platform/embedded/registry.h"

#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <utility>

#include "install/platform/embedded/history.h"
#include "install/platform/text.h"
#include "install/src/registry/registry_access.h"
#include "tests/support/registry_dump.h"
#include "tests/support/temporary_directory.h"

namespace kz7::test {
namespace {

constexpr KeyHandle kMachine = KeyHandle::localMachine;

// A view of one process; SQLite treats two of them as two processes.
class EmbeddedStore : public testing::Test {
protected:
    EmbeddedRegistry open() {
        return {directory_.path() + "/state", false, [this](const StoreFault& fault) { faults_ += fault.reason; }};
    }

    TemporaryDirectory directory_;
    std::string faults_;
};

TEST_F(EmbeddedStore, AHandleOutlivesACommitAndSeesOtherChanges) {
    EmbeddedRegistry mine = open();
    for (const char* path : {"K\\a", "K\\b", "Gone"}) {
        ASSERT_EQ(setText(mine, path, "v", "1"), kSuccess);
    }
    OwnedKey key(mine);
    OwnedKey gone(mine);
    ASSERT_EQ(mine.openKey(kMachine, "K", kKeyFull, key.receive()), kSuccess);
    ASSERT_EQ(mine.openKey(kMachine, "Gone", kKeyFull, gone.receive()), kSuccess);
    FixedBuffer<16> name;
    ASSERT_EQ(mine.enumerateKey(key.get(), 1, name, nullptr), kSuccess);
    ASSERT_EQ(mine.commit(), kSuccess);
    {
        EmbeddedRegistry other = open();
        ASSERT_EQ(setText(other, "K\\aa", "v", "1"), kSuccess);
        ASSERT_EQ(other.deleteKey(kMachine, "Gone", 0), kSuccess);
        ASSERT_EQ(setText(other, "Gone", "another key of that name", ""), kSuccess);
        ASSERT_EQ(other.commit(), kSuccess);
    }
    EXPECT_EQ(mine.enumerateKey(key.get(), 1, name, nullptr), kSuccess);
    EXPECT_EQ(name.view(), "aa");
    EXPECT_EQ(mine.enumerateKey(key.get(), 3, name, nullptr), kNoMoreItems);
    EXPECT_EQ(mine.setValue(gone.get(), "v", ValueType::sz, {}), kKeyDeleted);
}

TEST_F(EmbeddedStore, OnlyAWriteCreatesTheCallersKey) {
    EmbeddedRegistry registry = open();
    OwnedKey key(registry);
    FixedBuffer<16> room;
    const std::string name = "S-1-22-1-" + std::to_string(geteuid());
    for (int round = 0; round < 2; ++round) {
        EXPECT_EQ(registry.openKey(KeyHandle::currentUser, {}, kKeyRead, key.receive()), kFileNotFound);
        EXPECT_EQ(registry.openKey(KeyHandle::currentUser, "x", kKeyRead, key.receive()), kFileNotFound);
        EXPECT_EQ(registry.queryValue(KeyHandle::currentUser, "v", nullptr, room), kFileNotFound);
        EXPECT_EQ(registry.deleteValue(KeyHandle::currentUser, "v"), kFileNotFound);
        EXPECT_EQ(registry.enumerateKey(KeyHandle::currentUser, 0, room, nullptr), kNoMoreItems);
        EXPECT_EQ(registry.deleteKey(KeyHandle::currentUser, {}, 0), kFileNotFound);
        EXPECT_EQ(dumpRegistry(registry, KeyHandle::users), "");
        ASSERT_EQ(round == 0 ? registry.createKey(KeyHandle::currentUser, "Mine", {}, kKeyFull, key.receive())
                             : registry.setValue(KeyHandle::currentUser, "v", ValueType::sz, {}),
                  kSuccess);
        EXPECT_EQ(dumpRegistry(registry, KeyHandle::users),
                  compose(round == 0 ? "[%s] \n[%s\\Mine] \n" : "[%s] \n%s : v = 1:\n", {name, name}));
        EXPECT_EQ(registry.deleteKey(KeyHandle::currentUser, "Mine", 0), round == 0 ? kSuccess : kFileNotFound);
        EXPECT_EQ(registry.deleteKey(KeyHandle::users, name, 0), kSuccess) << "by its other name";
    }
}

TEST_F(EmbeddedStore, AHandleOfADroppedKeyNeverRefersToAnotherKey) {
    EmbeddedRegistry mine = open();
    OwnedKey kept(mine);
    OwnedKey dropped(mine);
    ASSERT_EQ(mine.createKey(kMachine, "Kept", {}, kKeyFull, kept.receive()), kSuccess);
    ASSERT_EQ(mine.commit(), kSuccess);
    ASSERT_EQ(mine.createKey(kMachine, "Dropped", {}, kKeyFull, dropped.receive()), kSuccess);
    const std::string log = directory_.path() + "/state/registry.db-wal";
    const rlimit full{std::filesystem::file_size(log), RLIM_INFINITY};
    const rlimit usual{RLIM_INFINITY, RLIM_INFINITY};
    std::signal(SIGXFSZ, SIG_IGN);
    setrlimit(RLIMIT_FSIZE, &full);
    EXPECT_EQ(mine.commit(), kDiskFull);
    setrlimit(RLIMIT_FSIZE, &usual);
    EmbeddedRegistry other = open();
    ASSERT_EQ(setText(other, "Others", "v", "1"), kSuccess);
    ASSERT_EQ(other.commit(), kSuccess);
    EXPECT_EQ(mine.setValue(dropped.get(), "v", ValueType::sz, "mine"), kKeyDeleted);
    EXPECT_EQ(mine.setValue(kept.get(), "v", ValueType::sz, {}), kSuccess);
    EXPECT_EQ(mine.closeKey(dropped.get()), kSuccess);
    dropped.leaveOpen();
}

TEST_F(EmbeddedStore, TheLogDoesNotGrowWithoutLimit) {
    for (int run = 0; run < 40; ++run) {
        EmbeddedRegistry registry = open();
        ASSERT_EQ(setText(registry, "K", "v" + std::to_string(run), std::string(20000, 'x')), kSuccess);
        ASSERT_EQ(registry.commit(), kSuccess);
    }
    EXPECT_LT(std::filesystem::file_size(directory_.path() + "/state/registry.db-wal"), std::size_t{400} * 1024);
}

// A thousand runs, and as many of them as fit into 256 MiB.
TEST(EmbeddedHistory, KeepsTheNewestRuns) {
    const auto listener = [](const StoreFault& fault) { ADD_FAILURE() << fault.reason; };
    EmbeddedRegistry registry({}, false, listener, {.inMemory = true});
    EmbeddedHistory history(registry);
    const auto run = [&](std::size_t bytes) {
        history.begin({.program = "test", .arguments = {}});
        history.append(std::string(bytes, 'x'));
        EXPECT_EQ(history.settle({.values = 1}), kSuccess);
        EXPECT_EQ(registry.commit(), kSuccess);
        history.end(kSuccess);
    };
    const auto expectRuns = [&](std::uint64_t first, std::uint64_t last) {
        std::vector<HistoryRun> runs;
        HistoryChanges kept;
        ASSERT_EQ(history.list(runs), kSuccess);
        ASSERT_EQ(runs.size(), last - first + 1);
        EXPECT_EQ(runs.front().number, first);
        EXPECT_EQ(runs.back().number, last);
        EXPECT_EQ(history.read(first - 1, kept), kSuccess);
        EXPECT_TRUE(kept.parts.empty());
        EXPECT_EQ(history.read(first, kept), kSuccess);
        EXPECT_EQ(kept.parts.size(), 1U);
    };
    for (int each = 0; each < 1049; ++each) {
        run(100);
    }
    expectRuns(26, 1049);
    constexpr std::size_t kMiB = std::size_t{1} << 20;
    for (const std::size_t size : {100 * kMiB, 100 * kMiB, 100 * kMiB, 56 * kMiB, 257 * kMiB}) {
        run(size);
    }
    expectRuns(1051, 1053);
}

}  // namespace
}  // namespace kz7::test
