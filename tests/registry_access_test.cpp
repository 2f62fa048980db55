#include "install/src/registry/registry_access.h"

#include <gtest/gtest.h>

#include "tests/support/machine.h"

namespace kz7::test {
namespace {

constexpr KeyHandle kMachine = KeyHandle::localMachine;

TEST(RegistryAccess, ATreeCopyKeepsWhatIsThereUnlessToldAndEndsAtWhatDoesNotFit) {
    for (const bool overwrite : {false, true}) {
        Machine machine;
        for (const char* key : {"From\\Sub", "To\\Sub"}) {
            machine.set(key, "both", key[0] == 'F' ? "new" : "old");
            machine.set(key, key[0] == 'F' ? "source" : "target", "kept");
        }
        const auto copy = [&] { return TreeCopy(machine.registry_).copy(kMachine, "From", kMachine, "To", overwrite); };
        EXPECT_EQ(copy(), kSuccess);
        EXPECT_EQ(machine.values("To\\Sub"),
                  std::string("both=") + (overwrite ? "new" : "old") + "! source=kept! target=kept!");
        machine.set("From\\Large", "v", std::string(9'999, 'x'));
        EXPECT_EQ(copy(), kSuccess);
        machine.set("From\\Large", "v", std::string(10'000, 'x'));
        EXPECT_EQ(copy(), kMoreData);
        machine.set("From\\Sub", std::string(260, 'n'), "");
        machine.set("From\\Large", "v", "");
        EXPECT_EQ(copy(), kMoreData);
    }
}

TEST(RegistryAccess, ATreeDeletionSparesANameAndTheKeysAboveIt) {
    const std::string token = "$CurrentInstallationName$";
    // clang-format off
    const struct {
        const char* why; std::string path; std::string copyName; const char* spared; Status status; const char* left;
    } rows[] = {
        {"an empty path",                            "",    "",                     "",       kBadKey,               nullptr},
        {"a placeholder without a name is literal",  token, "",                     "",       kFileNotFound,         nullptr},
        {"a path over its 1,024 bytes",              token, std::string(1024, 'T'), "",       kFilenameExceedsRange, nullptr},
        {"the spared name is compared with its case", "T",  "",                     "sPARED", kSuccess,              "[Beside] \n"},
        // The key with the spared one below it cannot go, and that failure ends the walk there.
        {"a spared subkey keeps all below it", "T", "", "Spared", kAccessDenied,
         "[Beside] \n[T] \n[T\\Spared] \n[T\\Spared\\x] \n[T\\Spared\\y] \n[T\\z] \n[T\\z\\Spared] \n[T\\z\\Spared\\w] \n"},
        {"a spared name deeper down ends the walk at the key above it", "T", "", "w", kAccessDenied,
         "[Beside] \n[T] \n[T\\z] \n[T\\z\\Spared] \n[T\\z\\Spared\\w] \n"},
    };
    // clang-format on
    for (const auto& row : rows) {
        Machine machine;
        for (const char* path : {"T\\a\\b", "T\\Spared\\x", "T\\spared\\y", "T\\z\\Spared\\w", "Beside"}) {
            machine.make(path);
        }
        const std::string before = machine.dump();
        EXPECT_EQ(deleteTree(machine.registry_, kMachine, row.path, 0, row.copyName, row.spared), row.status)
            << row.why;
        EXPECT_EQ(machine.dump(), row.left == nullptr ? before : row.left) << row.why;
    }
}

TEST(RegistryAccess, ATreeDeletionReachesBelowThePathsThatFit) {
    Machine machine;
    machine.make("Beside");
    OwnedKey key(machine.registry_);
    machine.registry_.createKey(kMachine, "T", {}, kKeyFull, key.receive());
    for (int level = 0; level < 20; ++level) {
        for (const char* name : {"leaf", "spared", "$CurrentInstallationName$"}) {
            OwnedKey leaf(machine.registry_);
            machine.registry_.createKey(key.get(), name, {}, kKeyFull, leaf.receive());
        }
        OwnedKey below(machine.registry_);
        machine.registry_.createKey(key.get(), std::string(250, 'n'), {}, kKeyFull, below.receive());
        key = std::move(below);
    }
    key.reset();
    EXPECT_EQ(deleteTree(machine.registry_, kMachine, "T", 0, {}, "spared"), kAccessDenied);
    EXPECT_EQ(deleteTree(machine.registry_, kMachine, "T", 0, "NAME", {}), kSuccess);
    EXPECT_EQ(machine.dump(), "[Beside] \n");
}

TEST(RegistryAccess, ARefusalToReadAValueIsNoAbsence) {
    Machine machine;
    OwnedKey key(machine.registry_);
    machine.registry_.createKey(kMachine, "K", {}, kKeySetValue, key.receive());
    EXPECT_TRUE(valueExists(machine.registry_, key.get(), "none"));
}

}  // namespace
}  // namespace kz7::test
