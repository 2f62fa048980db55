// The list of installed copies, the computation of the version aliases, and their rewrite with every call that can
// fail.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <map>
#include <random>
#include <set>

#include "install/src/copies/alias_rewrite.h"
#include "install/src/copies/ilist.h"
#include "install/src/copies/product_lists.h"
#include "install/src/registry/copy_layout.h"
#include "tests/support/fault_sweep.h"

namespace kz7::test {
namespace {

const std::string kNative(layout::kCopies);
const std::string kWow(layout::kCopies32);

struct Element {
    explicit Element(int& count) : alive(count) { ++alive; }
    virtual ~Element() { --alive; }
    int& alive;
};

TEST(IntrusiveList, AWalkContinuesAfterARemovalAndTheDestructorFreesEveryElement) {
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

TEST(ClassTree, KeyObjectsOpenOrCreateAKey) {
    Machine machine;
    const KZ7iCopyNameRegistry key(machine.registry_, KeyHandle::localMachine, "Copies\\$CurrentInstallationName$",
                                   "C1");
    EXPECT_EQ(key.status(), kSuccess);
    EXPECT_TRUE(machine.has("Copies\\C1"));
    const KZ7iRegistry none(machine.registry_, KeyHandle::localMachine, std::string(256, 'k'));
    EXPECT_EQ(none.status(), kInvalidParameter);
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
    const std::string stem(64, 'n');
    machine.set(kNative + "\\b", "KZ7 Path Name", "C:\\b\\");
    machine.set(kNative + "\\_", "KZ7 Path Name", "C:\\_\\\\");
    machine.set(kNative + "\\A", "KZ7 Path Name", std::string(255, 'p'));
    machine.set(kNative + "\\" + stem + "one", "KZ7 Path Name", "C:\\1");
    machine.make(kNative + "\\no path");
    machine.set(kNative + "\\too long a path", "KZ7 Path Name", std::string(256, 'p'));
    machine.set(kNative + "\\" + std::string(230, 'n'), "KZ7 Path Name", "C:\\n");
    machine.set(kNative + "\\A\\COMPONENTS", "one", "");
    machine.set(kNative + "\\A\\COMPONENTS", std::string(255, 'n'), "");
    machine.set(kNative + "\\A\\COMPONENTS", "behind it", "");
    machine.make(kNative + "\\b\\Users");

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

TEST(InstalledCopies, BeginWithAVersion8Installation) {
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
        machine.set(kNative + "\\C", "KZ7 Path Name", "C:\\c");
        if (row.path) {
            machine.set("SOFTWARE\\NVQ\\KZ7", "KZ7 Path Name", "C:\\8");
        }
        InstallCopyList list(machine.registry_, machine.debugOutput_, false, false);
        EXPECT_EQ(names(list), row.listed) << row.why;
        EXPECT_EQ(list.status(), row.status) << row.why;
        EXPECT_EQ(list.version8Copy() != nullptr, list.count() == 2) << row.why;
    }
}

TEST(InstalledCopies, AreEmptyWithoutAKeyAndSeparateForThe32BitView) {
    Machine machine;
    InstallCopyList none(machine.registry_, machine.debugOutput_, false, false);
    EXPECT_EQ(none.count() + none.status(), 0U);
    machine.set(kWow + "\\W", "KZ7 Path Name", "C:\\w");
    machine.set(kWow + "\\V", "KZ7 Path Name", "C:\\v");
    machine.make(kWow + "\\V\\Components");
    InstallCopyList list(machine.registry_, machine.debugOutput_, true, false);
    EXPECT_EQ(names(list), "V=C:\\v;") << "without components in its view a copy is left out";
}

struct Version {
    std::string copy, version, release, modification, fixLevel;  // an empty field is missing
};

void addVersion(Machine& machine, const Version& row) {
    const std::string key = kNative + "\\" + row.copy + "\\CurrentVersion";
    machine.make(key);
    for (const auto& [name, data] : {std::pair{"Version", row.version},
                                     {"Release", row.release},
                                     {"Modification", row.modification},
                                     {"Fix Level", row.fixLevel}}) {
        if (!data.empty()) {
            machine.set(key, name, data);
        }
    }
}

Status rewrite(Machine& machine) {
    return InstallCopiesProfile(machine.registry(), machine.debugOutput()).run();
}

// The aliases by definition: a search among all copies for each prefix of each version.
AliasMap searchedAliases(const CopiesByVersion& copies) {
    AliasMap profile;
    for (const auto& [text, copy] : copies) {
        std::size_t component = 0;
        for (std::size_t end = 0; end != std::string::npos;) {
            end = text.find('.', component == 0 ? 0 : end + 1);
            ++component;
            const std::string prefix = text.substr(0, end);
            profile[prefix] = highestVersionLeadingBy(copies, prefix, component == 4);
        }
    }
    return profile;
}

TEST(AliasComputation, EqualsASearchForEachPrefix) {
    // Prefixes of one another, both cases, characters on either side of the dot, bytes above 127, components that
    // are empty or contain a dot.
    const std::vector<std::string> pieces = {"9",  "1",  "10", "0",    "fp1", "FP1", "Fp1", "a", "Z",    "_",
                                             "-1", "9-", "/",  "\xE4", "0.1", ".",   ".5",  "",  "a.fp", "A.FP."};
    std::mt19937 random(20090101);
    const auto pick = [&] { return pieces[random() % pieces.size()]; };
    std::size_t differentCases = 0;
    for (int round = 0; round < 2000; ++round) {
        Machine machine;
        const std::size_t copies = 1 + random() % 12;
        const bool few = random() % 2 == 0;  // few versions have many common prefixes
        for (std::size_t copy = 0; copy < copies; ++copy) {
            addVersion(machine, {"C" + std::to_string(copy), few ? "9" : pick(), few ? "1" : pick(), pick(), pick()});
        }
        InstallCopiesProfile profile(machine.registry_, machine.debugOutput_);
        ASSERT_EQ(profile.generateInstallCopiesList(), kSuccess);
        ASSERT_EQ(profile.generateProfileInfo(), kSuccess);
        ASSERT_EQ(profile.profileInfo(), searchedAliases(profile.copiesByVersion())) << "round " << round;
        std::set<std::string> folded;
        for (const auto& [prefix, copy] : profile.profileInfo()) {
            folded.insert(foldUpper(prefix));
        }
        differentCases += profile.profileInfo().size() - folded.size();
    }
    EXPECT_GT(differentCases, 500U) << "there are prefixes that differ in case only";
}

TEST(AliasRewrite, LeavesExactlyTheAliasesOfTheCopiesThatAreThere) {
    const std::string longName(100, '9');
    using Values = std::vector<std::pair<std::string, std::string>>;
    // clang-format off
    const struct {
        const char* why; std::vector<Version> copies; Values values; std::string after;  // values in both views
    } rows[] = {
        {"each prefix names the highest", {{"A", "9", "5", "0", "0"}, {"B", "9", "7", "0", "0"}, {"C", "9", "7", "0", "4"}}, {},
         "9.5.0.0=A 9.5.0=A 9.5=A 9.7.0.0=B 9.7.0.4=C 9.7.0=C 9.7=C 9=C"},
        {"texts are compared, not numbers, and a prefix ends at a dot",
         {{"A", "9", "10", "0", "0"}, {"B", "9", "5", "0", "0"}, {"C", "10", "1", "0", "0"}}, {},
         "10.1.0.0=C 10.1.0=C 10.1=C 10=C 9.10.0.0=A 9.10.0=A 9.10=A 9.5.0.0=B 9.5.0=B 9.5=B 9=B"},
        {"aliases of copies that are gone go, others stay", {{"A", "9", "7", "0", "0"}},
         {{"9.7", "GONE"}, {"9.6", "GONE"}, {"9.7.8.DEF.2", "d"}, {"DEFAULT_COPY", "d"}, {"", "d"}, {"9def", "x"}},
         "9.7.0.0=A 9.7.0=A 9.7.8.DEF.2=d! 9.7=A 9=A =d! DEFAULT_COPY=d!"},
        {"the later of two equal versions, and a missing fix level is 0",
         {{"first", "9", "7", "1", "0"}, {"second", "9", "7", "1", ""}}, {},
         "9.7.1.0=second 9.7.1=second 9.7=second 9=second"},
        {"no valid copy leaves none", {{"A", "9", "7", "", ""}}, {{"9", "A"}, {"keep", "A"}}, "keep=A!"},
        {"the fourth prefix is looked up exactly, the fifth not at all", {{"A", "9", "7", "0", "0.1"}}, {},
         "9.7.0.0.1= 9.7.0.0= 9.7.0=A 9.7=A 9=A"},
        {"names that differ in case only are one value, the first spelling stays",
         {{"A", "9", "1", "0", "FP1"}, {"B", "9", "1", "0", "fp1"}}, {}, "9.1.0.FP1=B 9.1.0=B 9.1=B 9=B"},
        {"an empty first component is the default value", {{"A", ".9", "1", "0", "0"}}, {},
         ".9.1.0.0= .9.1.0= .9.1=A .9=A =A"},
        {"the walk ends at a name that does not fit", {{"A", "9", "7", "0", "0"}},
         {{"8", "old"}, {longName, "old"}, {"9.6", "old"}}, "9.6=old! 9.7.0.0=A 9.7.0=A 9.7=A " + longName + "=old! 9=A"},
    };
    // clang-format on
    for (const auto& row : rows) {
        Machine machine;
        for (const Version& copy : row.copies) {
            addVersion(machine, copy);
        }
        for (const std::string& view : {kNative, kWow}) {
            machine.make(view);
            for (const auto& [name, data] : row.values) {
                machine.set(view, name, data);
            }
        }
        for (int run = 0; run < 2; ++run) {
            EXPECT_EQ(rewrite(machine), kSuccess) << row.why;
            EXPECT_EQ(machine.values(kNative), row.after) << row.why << run;
            EXPECT_EQ(machine.values(kWow), row.after) << row.why << run;
        }
    }
}

TEST(AliasRewrite, TracesWhatItFinds) {
    Machine machine;
    addVersion(machine, {"A", "9", "7", "0", "0.1"});
    machine.make(kWow);
    rewrite(machine);
    const std::vector<std::string> expected = {"Valid version info of Install Copy 'A'",
                                               "The highest version leading by '9:9.7.0.0.1--A",
                                               "The highest version leading by '9.7:9.7.0.0.1--A",
                                               "The highest version leading by '9.7.0:9.7.0.0.1--A",
                                               "The highest version leading by '9.7.0.0': ( none )",
                                               "Did not find corrsponding install name for '9.7.0.0'",
                                               "The highest version leading by '9.7.0.0.1': ( none )",
                                               "Did not find corrsponding install name for '9.7.0.0.1'"};
    EXPECT_EQ(machine.debugOutput_.messages, expected);
}

const std::string kLongData(120, 'x');

// One alias is stale, one names another copy, three are new; the data of one is too long for the backup.
void staleAliases(FaultyMachine& machine) {
    addVersion(machine, {"A", "9", "7", "0", "0"});
    for (const std::string& view : {kNative, kWow}) {
        machine.setRaw(view, "8", "GONE");
        machine.setRaw(view, "9", "OLD");
    }
    machine.setRaw(kNative, "8.1", kLongData);
}

// The aliases of a view, with short names for common parts.
std::string stateOf(std::string values) {
    const std::pair<std::string, std::string> parts[] = {{"9.7.0.0=A 9.7.0=A 9.7=A 9=A", "new"},
                                                         {"8.1=" + kLongData + " 8=GONE 9=OLD", "old"},
                                                         {"8.1= 8=GONE 9=OLD", "cut"},
                                                         {"8=GONE 9=OLD", "old"}};
    for (const auto& [text, name] : parts) {
        const std::size_t at = values.find(text);
        values.replace(std::min(at, values.size()), at == std::string::npos ? 0 : text.size(),
                       at == std::string::npos ? "" : name);
    }
    const bool isPart = std::count(values.begin(), values.end(), '=') == 3 && values.find("OLD") == std::string::npos;
    return isPart ? "new but one" : values.ends_with(" new") ? "mixed" : values;
}

TEST(AliasRewriteUnderFaults, LeavesWhatTheStepThatFailedStatesAndNothingElse) {
    std::map<std::string, std::set<std::string>> outcomes;
    const auto flow = [](FaultyMachine& machine) { return rewrite(machine); };
    const std::uint64_t calls = sweepFaults(false, staleAliases, flow, [&](FaultyMachine& machine, Status status) {
        outcomes[machine.faults_.failed()].insert((status == kSuccess ? "0 " : "-1 ") +
                                                  stateOf(machine.values(kNative)) + " | " +
                                                  stateOf(machine.values(kWow)));
    });
    EXPECT_GT(calls, 60U);
    // clang-format off
    const std::map<std::string, std::set<std::string>> expected = {
        {"", {"0 new | new"}},
        {"closeKey", {"0 new | new"}},
        // A view that cannot be opened before the first deletion, during the deletions and after them; a copy that cannot
        // be read has no aliases, but a missing fix level is 0.
        {"openKey", {"-1 old | old", "-1 cut | old", "-1 new but one | new", "-1 new | new but one", "0  | ", "0 new | new"}},
        {"queryValue", {"0  | ", "0 new | new"}},
        {"enumerateKey", {"0  | ", "0 new | new"}},
        {"deleteValue", {"-1 cut | old"}},
        {"setValue", {"-1 new but one | new", "-1 new | new but one"}},
        // A walk that fails counts as one that has ended.
        {"enumerateValue", {"0 new | new", "0 mixed | new", "0 new | mixed"}},
    };
    // clang-format on
    EXPECT_EQ(outcomes, expected);
}

}  // namespace
}  // namespace kz7::test
