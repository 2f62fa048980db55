// The version aliases: what is read of the copies, which copy answers to which prefix, and the rewrite with all
// its ways to fail.
#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <set>

#include "install/src/copies/install_copies_profile.h"
#include "install/src/registry/copy_layout.h"
#include "tests/support/fault_sweep.h"

namespace kz7::test {
namespace {

const std::string kNative(layout::kCopies);
const std::string kWow(layout::kCopies32);

struct Version {
    std::string copy, version, release, modification, fixLevel;  // an empty field is not there
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
        const bool few = random() % 2 == 0;  // few versions make many neighbours
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

// One alias goes, one stays with another copy, three are new; one cannot be backed up whole.
void staleAliases(FaultyMachine& machine) {
    addVersion(machine, {"A", "9", "7", "0", "0"});
    for (const std::string& view : {kNative, kWow}) {
        machine.setRaw(view, "8", "GONE");
        machine.setRaw(view, "9", "OLD");
    }
    machine.setRaw(kNative, "8.1", kLongData);
}

// What a rewrite of these aliases left in a view, in words; as it stands where there are none for it.
std::string stateOf(const std::string& values) {
    const std::string fresh = "9.7.0.0=A 9.7.0=A 9.7=A 9=A";
    const std::pair<std::string, const char*> states[] = {
        {fresh, "new"},
        {"", "none"},
        {"8=GONE 9=OLD", "old"},
        {"8.1=" + kLongData + " 8=GONE 9=OLD", "old"},
        {"8.1= 8=GONE 9=OLD", "old, data over 99 characters empty"},
    };
    for (const auto& [text, state] : states) {
        if (values == text) {
            return state;
        }
    }
    const bool isPart = std::count(values.begin(), values.end(), '=') == 3 && values.find("OLD") == std::string::npos;
    return isPart ? "new but for one" : values.ends_with(fresh) ? "new beside old" : values;
}

TEST(AliasRewriteUnderFaults, LeavesWhatTheStepThatFailedStatesAndNothingElse) {
    std::set<std::string> outcomes;
    const auto flow = [](FaultyMachine& machine) { return rewrite(machine); };
    const std::uint64_t calls = sweepFaults(false, staleAliases, flow, [&](FaultyMachine& machine, Status status) {
        outcomes.insert(machine.faults_.failed() + ": " + (status == kSuccess ? "0 " : "-1 ") +
                        stateOf(machine.values(kNative)) + " | " + stateOf(machine.values(kWow)));
    });
    EXPECT_GT(calls, 60U);
    const std::set<std::string> expected = {
        ": 0 new | new",
        "closeKey: 0 new | new",
        // A view that cannot be opened, before anything is deleted and while it is.
        "openKey: -1 old | old",
        "openKey: -1 old, data over 99 characters empty | old",
        "deleteValue: -1 old, data over 99 characters empty | old",
        "openKey: -1 new but for one | new",
        "openKey: -1 new | new but for one",
        "setValue: -1 new but for one | new",
        "setValue: -1 new | new but for one",
        // A walk that breaks off is one that has ended.
        "enumerateValue: 0 new | new",
        "enumerateValue: 0 new beside old | new",
        "enumerateValue: 0 new | new beside old",
        "enumerateKey: 0 new | new",
        // A copy that is not listed or cannot be read has no aliases; a missing fix level is 0.
        "enumerateKey: 0 none | none",
        "openKey: 0 none | none",
        "openKey: 0 new | new",
        "queryValue: 0 none | none",
        "queryValue: 0 new | new",
    };
    EXPECT_EQ(outcomes, expected);
}

}  // namespace
}  // namespace kz7::test
