#include "install/src/registry_access.h"

#include <gtest/gtest.h>

#include "tests/support/machine.h"

namespace kz7::test {
namespace {

constexpr KeyHandle kMachine = KeyHandle::localMachine;

TEST(TreeCopyTest, EndsWithZero) {
    std::string path = "From";
    for (int i = 0; i < 4; ++i) {
        path += "\\" + std::string(250, 'k');
    }
    // clang-format off
    const struct { const char* why; std::string key; std::string name; std::string data; } rows[] = {
        {"no source",                    "Elsewhere", "v",                   ""},
        {"a value over 10,000 bytes",    "From",      "v",                   std::string(10000, 'x')},
        {"a value name over the buffer", "From",      std::string(260, 'n'), ""},
        {"a path that does not fit on the target's side, whose cut form would name a sibling", path + "\\" + std::string(14, 'k'), "v", ""},
    };
    // clang-format on
    for (const auto& row : rows) {
        Machine machine;
        machine.set(row.key, row.name, row.data);
        // What the path on the target's side would name if it were cut.
        const std::string cut = ("Longer target" + row.key.substr(4)).substr(0, 1023);
        machine.set(cut, "v", "a sibling's");
        EXPECT_EQ(TreeCopy(machine.registry_).copy(kMachine, "From", kMachine, "Longer target", true), 0) << row.why;
        EXPECT_EQ(machine.values(cut), "v=a sibling's!") << row.why;
    }
}

TEST(TreeCopyTest, OverwriteDecidesAboutValuesThatAreThere) {
    for (const bool overwrite : {false, true}) {
        Machine machine;
        for (const char* key : {"From", "From\\Sub", "To", "To\\Sub"}) {
            machine.set(key, "both", key[0] == 'F' ? "new" : "old");
            machine.set(key, key[0] == 'F' ? "source" : "target", "kept");
        }
        EXPECT_EQ(TreeCopy(machine.registry_).copy(kMachine, "From", kMachine, "To", overwrite), 1);
        const std::string expected = std::string("both=") + (overwrite ? "new" : "old") + "! source=kept! target=kept!";
        EXPECT_EQ(machine.values("To"), expected);
        EXPECT_EQ(machine.values("To\\Sub"), expected);
    }
}

TEST(DeleteTreeTest, StatusAndWhatIsLeft) {
    const char* const tree[] = {"T", "T\\a\\b", "T\\Spared\\x", "T\\spared\\y", "T\\z", "T\\z\\Spared\\w", "Beside"};
    const std::string token = "$CurrentInstallationName$";
    // clang-format off
    const struct {
        const char* why; std::string path; std::string copyName; const char* spared; Status status; const char* left;
    } rows[] = {
        {"nothing spared",                           "T",       "",                     "",       kSuccess,              "[Beside] \n"},
        {"an empty path",                            "",        "",                     "",       kBadKey,               nullptr},
        {"a path that is not there",                 "Nowhere", "",                     "",       kFileNotFound,         nullptr},
        {"the placeholder stands for the name",      token,     "T",                    "",       kSuccess,              "[Beside] \n"},
        {"a placeholder without a name is literal",  token,     "",                     "",       kFileNotFound,         nullptr},
        {"a path over its 1,024 bytes",              token,     std::string(1024, 'T'), "",       kFilenameExceedsRange, nullptr},
        {"the spared name is compared with its case", "T",      "",                     "sPARED", kSuccess,              "[Beside] \n"},
        // The key with the spared one below it cannot go, and that failure ends the walk there.
        {"a spared subkey keeps all below it", "T", "", "Spared", kAccessDenied,
         "[Beside] \n[T] \n[T\\Spared] \n[T\\Spared\\x] \n[T\\Spared\\y] \n[T\\z] \n[T\\z\\Spared] \n[T\\z\\Spared\\w] \n"},
        {"a spared name deeper down ends the walk at the key above it", "T", "", "w", kAccessDenied,
         "[Beside] \n[T] \n[T\\z] \n[T\\z\\Spared] \n[T\\z\\Spared\\w] \n"},
    };
    // clang-format on
    for (const auto& row : rows) {
        Machine machine;
        for (const char* path : tree) {
            machine.make(path);
        }
        const std::string before = machine.dump();
        EXPECT_EQ(deleteTree(machine.registry_, kMachine, row.path, 0, row.copyName, row.spared), row.status)
            << row.why;
        EXPECT_EQ(machine.dump(), row.left == nullptr ? before : row.left) << row.why;
    }
}

TEST(Values, OnlyNotFoundMeansAbsent) {
    Machine machine;
    machine.set("K", "long", "more than a byte");
    OwnedKey key(machine.registry_);
    machine.registry_.openKey(kMachine, "K", kKeyQueryValue, key.receive());
    EXPECT_TRUE(valueExists(machine.registry_, key.get(), "long"));
    EXPECT_FALSE(valueExists(machine.registry_, key.get(), "none"));
    machine.registry_.openKey(kMachine, "K", kKeySetValue, key.receive());
    EXPECT_TRUE(valueExists(machine.registry_, key.get(), "none")) << "a refusal is no absence";
}

}  // namespace
}  // namespace kz7::test
