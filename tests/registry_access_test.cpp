#include "install/src/registry/registry_access.h"

#include <gtest/gtest.h>

#include "install/src/registry/copy_name.h"
#include "tests/support/machine.h"

namespace kz7::test {
namespace {

constexpr KeyHandle kMachine = KeyHandle::localMachine;

TEST(RegistryAccess, ATreeCopyPreservesOrOverwritesAndFailsAtLongData) {
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
        // The key above the spared one cannot be deleted, and that failure ends the deletion.
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

TEST(RegistryAccess, AValueThatCannotBeReadExists) {
    Machine machine;
    OwnedKey key(machine.registry_);
    machine.registry_.createKey(kMachine, "K", {}, kKeySetValue, key.receive());
    EXPECT_TRUE(valueExists(machine.registry_, key.get(), "none"));
}

TEST(CopyName, Substitution) {
    // clang-format off
    const struct { const char* why; const char* text; const char* name; const char* result; } rows[] = {
        {"every occurrence",                 "A\\$CurrentInstallationName$-$CurrentInstallationName$", "X", "A\\X-X"},
        {"the other token where the first is missing", "$DefaultInstallationName$",                    "X", "X"},
        {"only one of the two",              "$DefaultInstallationName$$CurrentInstallationName$", "X", "$DefaultInstallationName$X"},
        {"what is inserted is not searched", "$CurrentInstallationName$", "a$CurrentInstallationName$b", "a$CurrentInstallationName$b"},
        {"an empty name leaves the text",    "A\\$CurrentInstallationName$", "", "A\\$CurrentInstallationName$"},
        {"case counts",                      "$currentinstallationname$",   "X", "$currentinstallationname$"},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(substituteCopyName(row.text, row.name), row.result) << row.why;
    }
}

TEST(CopyName, ResultGoesWhereTheCallerSays) {
    const char* const text = "$CurrentInstallationName$";
    EXPECT_EQ(iSubstituteCopyName(text, nullptr, 0, nullptr), text) << "no name: the input itself";
    EXPECT_EQ(iSubstituteCopyName("none", "X", 0, nullptr), std::string("none"));

    const char* const shared = iSubstituteCopyName(text, "first", 0, nullptr);
    EXPECT_STREQ(shared, "first");
    EXPECT_EQ(iSubstituteCopyName(text, "second", 0, nullptr), shared) << "one buffer for all";
    EXPECT_STREQ(shared, "second");

    char output[40];
    EXPECT_EQ(iSubstituteCopyName(text, "X", 25, output), nullptr) << "refused although the result would fit";
    EXPECT_EQ(iSubstituteCopyName(text, "X", 26, output), output);
    EXPECT_STREQ(output, "X");
    EXPECT_EQ(iSubstituteCopyName("none", "X", sizeof output, output), std::string("none"));
    EXPECT_STREQ(output, "none");

    output[26] = '#';
    EXPECT_EQ(iSubstituteCopyName(text, std::string(60, 'n').c_str(), 26, output), output);
    EXPECT_EQ(std::string(output), std::string(25, 'n')) << "cut to the size and terminated";
    EXPECT_EQ(output[26], '#') << "never past it";

    const std::string longer(2000, 'l');
    EXPECT_EQ(iSubstituteCopyName(longer.c_str(), "X", 0, nullptr), longer.c_str()) << "unchanged, it needs no room";
    std::string room(2001, '#');
    EXPECT_EQ(iSubstituteCopyName(longer.c_str(), nullptr, 2001, room.data()), longer.c_str());
    EXPECT_EQ(room.c_str(), longer);
    const std::string filled = std::string(iSubstituteCopyName(text, std::string(2000, 'n').c_str(), 0, nullptr));
    EXPECT_EQ(filled.size(), kSubstitutedSize - 1);
}

}  // namespace
}  // namespace kz7::test
