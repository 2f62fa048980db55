#include "install/src/registry_access.h"

#include <gtest/gtest.h>

#include "tests/support/machine.h"

namespace kz7::test {
namespace {

constexpr KeyHandle kMachine = KeyHandle::localMachine;

TEST(TreeCopyTest, CopiesNamesClassesTypesAndBytes) {
    Machine machine;
    machine.make("From\\Sub key\\%s", "a class");
    machine.set("From", "", "default");
    machine.set("From\\Sub key\\%s", "value.1", "text");
    OwnedKey key(machine.registry_);
    machine.registry_.openKey(kMachine, "From", kKeyFull, key.receive());
    machine.registry_.setValue(key.get(), "bytes", ValueType::binary, std::string_view("\0\xFF\0", 3));
    const std::string source = machine.dump("From");

    EXPECT_EQ(TreeCopy(machine.registry_).copy(kMachine, "From", kMachine, "To\\New", true), 1);

    std::string expected = source;
    for (std::size_t at = 0; (at = expected.find("From", at)) != std::string::npos;) {
        expected.replace(at, 4, "To\\New");
    }
    EXPECT_EQ(machine.dump("To\\New"), expected);
    EXPECT_EQ(machine.dump("From"), source);
}

TEST(TreeCopyTest, OverwriteDecidesAboutValuesThatAreThere) {
    for (const bool overwrite : {false, true}) {
        Machine machine;
        machine.set("From", "both", "new");
        machine.set("From\\Sub", "both", "new");
        machine.set("From", "only source", "new");
        machine.set("To", "both", "old");
        machine.set("To\\Sub", "both", "old");
        machine.set("To", "only target", "old");
        EXPECT_EQ(TreeCopy(machine.registry_).copy(kMachine, "From", kMachine, "To", overwrite), 1);
        const std::string kept = overwrite ? "new" : "old";
        EXPECT_EQ(machine.dump("To"), "To : both = 1:" + kept + "\\x00\nTo : only target = 1:old\\x00\n" +
                                          "To : only source = 1:new\\x00\n[To\\Sub] \nTo\\Sub : both = 1:" + kept +
                                          "\\x00\n");
    }
}

TEST(TreeCopyTest, EndsWithZero) {
    const struct {
        const char* why;
        void (*prepare)(Machine&);
        const char* source;
    } rows[] = {
        {"no source", [](Machine&) {}, "From"},
        {"a value over 10,000 bytes", [](Machine& machine) { machine.set("From", "v", std::string(10000, 'x')); },
         "From"},
        {"a value name over the buffer", [](Machine& machine) { machine.set("From", std::string(260, 'n'), ""); },
         "From"},
        {"a path that does not fit on the target's side, whose cut form would name a sibling",
         [](Machine& machine) {
             std::string path = "From";
             for (int i = 0; i < 4; ++i) {
                 path += "\\" + std::string(250, 'k');
             }
             machine.make(path + "\\" + std::string(14, 'k'));
         },
         "From"},
    };
    for (const auto& row : rows) {
        Machine machine;
        row.prepare(machine);
        EXPECT_EQ(TreeCopy(machine.registry_).copy(kMachine, row.source, kMachine, "Longer target", true), 0)
            << row.why;
        EXPECT_EQ(machine.registry_.openHandles(), 0U) << row.why;
    }
}

TEST(DeleteTreeTest, StatusAndWhatIsLeft) {
    const char* const tree[] = {"T", "T\\a\\b", "T\\Spared\\x", "T\\spared\\y", "T\\z", "T\\z\\Spared\\w", "Beside"};
    const struct {
        const char* why;
        const char* path;
        std::string copyName;
        const char* spared;
        Status status;
        std::string left;
    } rows[] = {
        {"nothing spared", "T", "", "", kSuccess, "[Beside] \n"},
        {"an empty path", "", "", "", kBadKey, "everything"},
        {"a path that is not there", "Nowhere", "", "", kFileNotFound, "everything"},
        {"the placeholder stands for the name", "$CurrentInstallationName$", "T", "", kSuccess, "[Beside] \n"},
        {"a placeholder without a name is literal", "$CurrentInstallationName$", "", "", kFileNotFound, "everything"},
        {"a path over its 1,024 bytes", "$CurrentInstallationName$", std::string(1024, 'T'), "", kFilenameExceedsRange,
         "everything"},
        // The key with the spared one below it cannot go, and that failure ends the walk there.
        {"a spared name deeper down ends the walk at the key above it", "T", "", "w", kAccessDenied,
         "[Beside] \n[T] \n[T\\z] \n[T\\z\\Spared] \n[T\\z\\Spared\\w] \n"},
    };
    for (const auto& row : rows) {
        Machine machine;
        for (const char* path : tree) {
            machine.make(path);
        }
        const std::string before = machine.dump();
        EXPECT_EQ(deleteTree(machine.registry_, kMachine, row.path, 0, row.copyName, row.spared), row.status)
            << row.why;
        EXPECT_EQ(machine.dump(), row.left == "everything" ? before : row.left) << row.why;
        EXPECT_EQ(machine.registry_.openHandles(), 0U) << row.why;
    }
}

TEST(DeleteTreeTest, SparesASubkeyWithAllBelowItAndTheValuesAbove) {
    Machine machine;
    machine.set("T", "kept value", "v");
    machine.make("T\\After");
    machine.make("T\\InstalledCopies\\A");
    machine.make("T\\Before");
    EXPECT_EQ(deleteTree(machine.registry_, kMachine, "T", 0, {}, "InstalledCopies"), kAccessDenied);
    EXPECT_EQ(machine.dump(), "[T] \nT : kept value = 1:v\\x00\n[T\\InstalledCopies] \n[T\\InstalledCopies\\A] \n");
    EXPECT_EQ(deleteTree(machine.registry_, kMachine, "T", 0, {}, "installedcopies"), kSuccess)
        << "the name is compared with its case";
}

TEST(Values, OnlyNotFoundMeansAbsent) {
    Machine machine;
    machine.set("K", "long", "more than a byte");
    machine.set("K", "empty", "");
    OwnedKey key(machine.registry_);
    machine.registry_.openKey(kMachine, "K", kKeyQueryValue, key.receive());
    EXPECT_TRUE(valueExists(machine.registry_, key.get(), "long"));
    EXPECT_TRUE(valueExists(machine.registry_, key.get(), "empty"));
    EXPECT_FALSE(valueExists(machine.registry_, key.get(), "none"));
    machine.registry_.openKey(kMachine, "K", kKeySetValue, key.receive());
    EXPECT_TRUE(valueExists(machine.registry_, key.get(), "none")) << "a refusal is no absence";
}

}  // namespace
}  // namespace kz7::test
