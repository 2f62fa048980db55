#include <gtest/gtest.h>

#include <cstring>

#include "install/src/copies/ilist.h"
#include "install/src/copies/product_lists.h"
#include "tests/support/machine.h"

namespace kz7::test {
namespace {

struct Element {
    explicit Element(int& count) : alive(count) { ++alive; }
    virtual ~Element() { --alive; }
    int& alive;
};

TEST(IntrusiveList, AWalkGoesOnAfterARemovalUnderItAndTheEndFreesEveryElement) {
    int alive = 0;
    {
        ILIST<Element> list;
        Element* elements[4];
        for (Element*& element : elements) {
            element = new Element(alive);
            list.append(element);
        }
        list.append(nullptr);
        EXPECT_EQ(list.first(), elements[0]);
        list.remove(elements[0]);
        EXPECT_EQ(list.next(), elements[1]) << "the head was removed under the walk";
        list.remove(elements[1]);
        EXPECT_EQ(list.next(), elements[2]);
        list.remove(elements[0]);
        EXPECT_EQ(list.count(), 3U) << "no node holds that one";
        EXPECT_EQ(alive, 2);
        ILIST<char> texts;
        texts.append(strdup("a plain buffer"));
    }
    EXPECT_EQ(alive, 0);
}

TEST(ClassTree, KeyObjectsOpenOrCreateAndListsOwnTheirElements) {
    Machine machine;
    InstalledProdList products;
    products.append(new InstalledProd("KZ7"));
    IKZ7INSTANCELIST instances;
    instances.append(new IKZ7INSTANCE("INST"));
    EXPECT_EQ(products.first()->name() + instances.first()->name(), "KZ7INST");
    const KZ7iCopyNameRegistry key(machine.registry_, KeyHandle::localMachine, "Copies\\$CurrentInstallationName$",
                                   "C1");
    EXPECT_EQ(key.status(), kSuccess);
    EXPECT_TRUE(machine.has("Copies\\C1"));
    const KZ7iRegistry none(machine.registry_, KeyHandle::localMachine, std::string(256, 'k'));
    EXPECT_EQ(none.status(), kInvalidParameter);
    EXPECT_EQ(InstallCopyListSingleton(machine.registry_, machine.debugOutput_, false, false).count(), 0U);
}

std::string names(InstallCopyList& copies) {
    std::string text;
    for (InstallCopy* copy = copies.first(); copy != nullptr; copy = copies.next()) {
        text += std::string(copy->copyName()) + "=" + std::string(copy->installPath()) + ";";
    }
    return text;
}

const std::string kCopies = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\";

TEST(InstalledCopies, AreListedInRegistryOrder) {
    Machine machine;
    const std::string stem(64, 'n');
    machine.set(kCopies + "b", "KZ7 Path Name", "C:\\b\\");
    machine.set(kCopies + "_", "KZ7 Path Name", "C:\\_\\\\");
    machine.set(kCopies + "A", "KZ7 Path Name", std::string(255, 'p'));
    machine.set(kCopies + stem + "one", "KZ7 Path Name", "C:\\1");
    machine.make(kCopies + "no path");
    machine.set(kCopies + "too long a path", "KZ7 Path Name", std::string(256, 'p'));
    machine.set(kCopies + std::string(230, 'n'), "KZ7 Path Name", "C:\\n");
    machine.set(kCopies + "A\\COMPONENTS", "one", "");
    machine.set(kCopies + "A\\COMPONENTS", std::string(255, 'n'), "");
    machine.set(kCopies + "A\\COMPONENTS", "behind it", "");
    machine.make(kCopies + "b\\Users");

    InstallCopyList list(machine.registry_, machine.debugOutput_, false, false);

    EXPECT_EQ(names(list), "A=" + std::string(255, 'p') + ";b=C:\\b;" + stem + "=C:\\n;" + stem + "=C:\\1;_=C:\\_\\;");
    EXPECT_EQ(list.status(), 0U);
    const std::vector<std::string> rejected = {"Invalid Installation Name", "no path", "Invalid Installation Name",
                                               "too long a path"};
    EXPECT_EQ(machine.debugOutput_.messages, rejected);
    InstallCopy* first = list.first();
    EXPECT_STREQ(first->components().first(), "one");
    EXPECT_EQ(first->components().count(), 1U) << "a name that fills the buffer ends the walk";
    EXPECT_FALSE(first->isPerUser());
    EXPECT_TRUE(list.next()->isPerUser());
    EXPECT_EQ(list.findByName("a"), first) << "without case";
    EXPECT_EQ(list.findByName("none"), nullptr);
    EXPECT_EQ(list.findByName(nullptr), nullptr);
    EXPECT_EQ(list.next()->keyPath().size(), 255U) << "cut for display";
    EXPECT_EQ(list.findByName((stem + "other").c_str()), nullptr) << "it agrees in 64 characters only";
    EXPECT_EQ(list.next(), list.findByName((stem + "ONE").c_str())) << "a search leaves the walk";
    EXPECT_EQ(list.findByName(stem.substr(1).c_str()), nullptr);
}

TEST(InstalledCopies, AVersion8InstallationIsTheFirstOfThem) {
    // clang-format off
    const struct { const char* why; const char* version; bool path; std::uint32_t status; const char* listed; } rows[] = {
        {"eight with its path",       "8",    true,  0, "KZ7V8=C:\\8;C=C:\\c;"},
        {"the text's integer counts", " 8.2", true,  0, "KZ7V8=C:\\8;C=C:\\c;"},
        {"another version",           "9",    true,  0, "C=C:\\c;"},
        {"a number that would wrap round to eight", "4294967304", true, 0, "C=C:\\c;"},
        {"no number",                 "v8",   true,  0, "C=C:\\c;"},
        {"eight without a path makes the whole list a failure", "8", false, 1, ""},
    };
    // clang-format on
    for (const auto& row : rows) {
        Machine machine;
        machine.set("SOFTWARE\\NVQ\\KZ7\\CurrentVersion", "Version", row.version);
        machine.set(kCopies + "C", "KZ7 Path Name", "C:\\c");
        if (row.path) {
            machine.set("SOFTWARE\\NVQ\\KZ7", "KZ7 Path Name", "C:\\8");
        }
        InstallCopyList list(machine.registry_, machine.debugOutput_, false, false);
        EXPECT_EQ(names(list), row.listed) << row.why;
        EXPECT_EQ(list.status(), row.status) << row.why;
        EXPECT_EQ(list.version8Copy() != nullptr, list.count() == 2) << row.why;
    }
}

TEST(InstalledCopies, NoKeyIsAnEmptyListAndThe32BitViewHasItsOwn) {
    Machine machine;
    InstallCopyList none(machine.registry_, machine.debugOutput_, false, false);
    EXPECT_EQ(none.count() + none.status(), 0U);
    machine.set("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\W", "KZ7 Path Name", "C:\\w");
    machine.set("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\V", "KZ7 Path Name", "C:\\v");
    machine.make("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\V\\Components");
    InstallCopyList list(machine.registry_, machine.debugOutput_, true, false);
    EXPECT_EQ(names(list), "V=C:\\v;") << "without components in its view a copy is left out";
}

}  // namespace
}  // namespace kz7::test
