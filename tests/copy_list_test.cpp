#include <gtest/gtest.h>

#include <cstring>

#include "install/src/copies/ilist.h"
#include "install/src/copies/install_copy_list.h"
#include "tests/support/machine.h"

namespace kz7::test {
namespace {

struct Element {
    explicit Element(int& count) : alive(count) { ++alive; }
    virtual ~Element() { --alive; }
    int& alive;
};

TEST(IntrusiveList, AWalkGoesOnAfterARemovalUnderIt) {
    int alive = 0;
    ILIST<Element> list;
    Element* elements[3];
    for (Element*& element : elements) {
        element = new Element(alive);
        list.append(element);
    }
    EXPECT_EQ(list.first(), elements[0]);
    list.remove(elements[0]);
    EXPECT_EQ(list.next(), elements[1]) << "the head was removed under the walk";
    list.remove(elements[1]);
    EXPECT_EQ(list.next(), elements[2]);
    EXPECT_EQ(list.next(), nullptr);
    list.remove(elements[0]);
    EXPECT_EQ(list.count(), 1U) << "no node holds that one";
    list.remove(elements[2]);
    EXPECT_EQ(list.count(), 0U);
    EXPECT_EQ(list.first(), nullptr);
    EXPECT_EQ(alive, 0);
}

TEST(IntrusiveList, TheEndOfAListFreesEveryElement) {
    int alive = 0;
    {
        ILIST<Element> list;
        list.append(new Element(alive));
        list.append(nullptr);
        list.append(new Element(alive));
        ILIST<char> texts;
        texts.append(strdup("a plain buffer"));
        EXPECT_EQ(alive, 2);
    }
    EXPECT_EQ(alive, 0);
}

std::string names(InstallCopyList& copies) {
    std::string text;
    for (InstallCopy* copy = copies.first(); copy != nullptr; copy = copies.next()) {
        text += std::string(copy->copyName()) + "=" + std::string(copy->installPath()) + ";";
    }
    return text;
}

TEST(InstalledCopies, AreListedInRegistryOrder) {
    Machine machine;
    const std::string copies = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\";
    machine.set(copies + "b", "KZ7 Path Name", "C:\\b\\");
    machine.set(copies + "_", "KZ7 Path Name", "C:\\_\\\\");
    machine.set(copies + "A", "KZ7 Path Name", std::string(255, 'p'));
    machine.make(copies + "no path");
    machine.set(copies + "too long a path", "KZ7 Path Name", std::string(256, 'p'));
    machine.set(copies + std::string(230, 'n'), "KZ7 Path Name", "C:\\n");
    machine.set(copies + "A\\COMPONENTS", "one", "");
    machine.set(copies + "A\\COMPONENTS", "two", "");
    machine.make(copies + "b\\Users");

    InstallCopyList list(machine.registry_, machine.debugOutput_, false, false);

    EXPECT_EQ(names(list), "A=" + std::string(255, 'p') + ";b=C:\\b;_=C:\\_\\;");
    EXPECT_EQ(list.status(), 0U);
    EXPECT_EQ(list.count(), 3U);
    const std::vector<std::string> rejected = {"Invalid Installation Name", std::string(230, 'n'),
                                               "Invalid Installation Name", "no path",
                                               "Invalid Installation Name", "too long a path"};
    EXPECT_EQ(machine.debugOutput_.messages, rejected);
    InstallCopy* first = list.first();
    EXPECT_STREQ(first->components().first(), "one");
    EXPECT_EQ(first->components().count(), 2U);
    EXPECT_FALSE(first->isPerUser());
    EXPECT_TRUE(list.next()->isPerUser());
    EXPECT_EQ(list.findByName("a"), first) << "without case";
    EXPECT_EQ(list.findByName("none"), nullptr);
    EXPECT_EQ(list.findByName(nullptr), nullptr);
    EXPECT_EQ(list.next()->copyName(), "_") << "a search leaves the walk where it was";
    EXPECT_EQ(machine.registry_.openHandles(), 0U);
}

TEST(InstalledCopies, NamesCompareByTheirFirst64Characters) {
    Machine machine;
    const std::string stem(64, 'n');
    machine.set("SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\" + stem + "one", "KZ7 Path Name", "C:\\1");
    InstallCopyList list(machine.registry_, machine.debugOutput_, false, false);
    ASSERT_NE(list.findByName((stem + "other").c_str()), nullptr);
    EXPECT_EQ(list.findByName(stem.c_str())->copyName(), stem);
    EXPECT_EQ(list.findByName(stem.c_str())->installPath(), "C:\\1") << "the key path takes the full name";
    EXPECT_EQ(list.findByName(stem.substr(1).c_str()), nullptr);
}

TEST(InstalledCopies, AVersion8InstallationIsTheFirstOfThem) {
    const struct {
        const char* why;
        const char* version;
        bool path;
        std::uint32_t status;
        const char* listed;
    } rows[] = {
        {"eight with its path", "8", true, 0, "KZ7V8=C:\\8;C=C:\\c;"},
        {"the text's integer counts", " 8.2", true, 0, "KZ7V8=C:\\8;C=C:\\c;"},
        {"another version", "9", true, 0, "C=C:\\c;"},
        {"no number", "v8", true, 0, "C=C:\\c;"},
        {"eight without a path makes the whole list a failure", "8", false, 1, ""},
    };
    for (const auto& row : rows) {
        Machine machine;
        machine.set("SOFTWARE\\NVQ\\KZ7\\CurrentVersion", "Version", row.version);
        machine.set("SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\C", "KZ7 Path Name", "C:\\c");
        if (row.path) {
            machine.set("SOFTWARE\\NVQ\\KZ7", "KZ7 Path Name", "C:\\8");
        }
        InstallCopyList list(machine.registry_, machine.debugOutput_, false, false);
        EXPECT_EQ(names(list), row.listed) << row.why;
        EXPECT_EQ(list.status(), row.status) << row.why;
        EXPECT_EQ(list.version8Copy() != nullptr, list.count() == 2) << row.why;
    }
}

TEST(InstalledCopies, AComponentNameThatFillsTheBufferEndsTheWalk) {
    Machine machine;
    const std::string copy = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\C";
    machine.set(copy, "KZ7 Path Name", "C:\\c");
    machine.set(copy + "\\Components", "short", "");
    machine.set(copy + "\\Components", std::string(255, 'n'), "");
    machine.set(copy + "\\Components", "behind it", "");
    InstallCopyList list(machine.registry_, machine.debugOutput_, false, false);
    EXPECT_EQ(list.first()->components().count(), 1U);
}

TEST(InstalledCopies, NoKeyIsAnEmptyListAndThe32BitViewHasItsOwn) {
    Machine machine;
    InstallCopyList none(machine.registry_, machine.debugOutput_, false, false);
    EXPECT_EQ(none.count(), 0U);
    EXPECT_EQ(none.status(), 0U);
    machine.set("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\W", "KZ7 Path Name", "C:\\w");
    machine.set("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\V", "KZ7 Path Name", "C:\\v");
    machine.make("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\V\\Components");
    InstallCopyList list(machine.registry_, machine.debugOutput_, true, false);
    EXPECT_EQ(names(list), "V=C:\\v;") << "without components in its view a copy is left out";
}

}  // namespace
}  // namespace kz7::test
