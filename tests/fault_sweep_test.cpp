// Every call of every flow fails in turn, once and for good: the flow ends, says so, leaks nothing, and what it
// was not to touch is still there. A new flow is a new row.
#include <gtest/gtest.h>

#include <set>

#include "tests/support/fault_sweep.h"

namespace kz7::test {
namespace {

const std::string kCopies = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies";

struct SweptFlow {
    const char* name;
    std::vector<std::string> arguments;
    std::size_t serviceHandlesLeftOpen;  // on purpose, at most
};

void twoCopies(FaultyMachine& machine) {
    machine.run({"-addKZ7Copy", "FIRST", "C:\\first"});
    machine.run({"-addKZ7Copy", "SECOND", "C:\\second"});
    machine.set("SOFTWARE\\Other", "v", "somebody else's");
    machine.set("SOFTWARE\\NVQ\\KZ7BackupV8\\PROFILES", "", "backup");
}

class FaultSweep : public testing::TestWithParam<SweptFlow> {};

const SweptFlow kSwept[] = {
    {"addNew", {"-addKZ7Copy", "THIRD", "C:\\third"}, 0},
    {"addAgain", {"-addKZ7Copy", "FIRST", "C:\\moved"}, 0},
    {"removeOne", {"-removeKZ7Copy", "FIRST"}, 0},
    {"removeUnknown", {"-removeKZ7Copy", "NONE"}, 0},
    {"version8", {"-v8", "C:\\KZ8"}, 2},
    {"version9", {"-v9", "C:\\KZ9"}, 0},
    {"dotnet", {"-dotnet", "C:\\KZ9"}, 0},
    {"addv9", {"-addv9", "THIRD", "C:\\third"}, 0},
};

TEST_P(FaultSweep, EndsSaysSoAndTouchesNothingElse) {
    const SweptFlow& flow = GetParam();
    const bool adds = flow.arguments[0] == "-addKZ7Copy";
    for (const bool forGood : {false, true}) {
        const std::uint64_t calls = sweepFaults(
            forGood, twoCopies, [&](FaultyMachine& machine) { return machine.run(flow.arguments); },
            [&](FaultyMachine& machine, Status status, const std::string& row) {
                EXPECT_EQ(machine.registry_.openHandles(), 0U) << row;
                EXPECT_LE(machine.services_.openHandles(), flow.serviceHandlesLeftOpen) << row;
                EXPECT_NE(machine.dump("SOFTWARE\\Other").find("somebody else's"), std::string::npos) << row;
                EXPECT_TRUE(machine.services_.find("KZ7MGMTSVC_SECOND") != nullptr) << row;
                const std::string& failed = machine.faults_.failed();
                // Closes and lines that did not reach the console judge nothing.
                if (failed.rfind("close", 0) == 0 || failed.rfind("write", 0) == 0 || failed == "flush") {
                    if (!forGood && flow.arguments[1] != "NONE") {
                        EXPECT_EQ(status, kSuccess) << row;
                    }
                    return;
                }
                if (adds) {
                    EXPECT_EQ(status, failed.empty() ? kSuccess : kFault) << row;
                    EXPECT_EQ(machine.console_.output.find("added successfully") != std::string::npos, failed.empty())
                        << row;
                    if (!forGood && !failed.empty()) {
                        EXPECT_NE(machine.console_.error.find(
                                      ":941: Unable to add a new copy of KZ7 to this machine : rc = 4321\n"),
                                  std::string::npos)
                            << row;
                    }
                    EXPECT_TRUE(machine.has(kCopies + "\\SECOND\\GLOBAL_PROFILE")) << row;
                }
            });
        EXPECT_GT(calls, 10U);
    }
}

INSTANTIATE_TEST_SUITE_P(Flows, FaultSweep, testing::ValuesIn(kSwept),
                         [](const testing::TestParamInfo<SweptFlow>& row) { return row.param.name; });

// What a removal takes away when one of its calls fails once. The list is read first: a copy that could not be
// read is not in it, a list that could not be read whole counts as that of the last copy.
TEST(RemovalUnderFaults, WhatIsLeftFollowsFromTheCallThatFailed) {
    std::set<std::string> outcomes;
    sweepFaults(
        false, twoCopies,
        [](FaultyMachine& machine) {
            return machine.run({"-removeKZ7Copy", "FIRST"});
        },
        [&](FaultyMachine& machine, Status status, const std::string& row) {
            const bool product = machine.has("SOFTWARE\\NVQ\\KZ7");
            const bool first = machine.has(kCopies + "\\FIRST");
            const bool second = machine.has(kCopies + "\\SECOND");
            outcomes.insert(machine.faults_.failed() + ": " + std::to_string(status) + (product ? " product" : "") +
                            (first ? " first" : "") + (second ? " second" : ""));
            EXPECT_TRUE(machine.has("SOFTWARE\\NVQ\\KZ7BackupV8\\PROFILES")) << row;
        });
    const std::set<std::string> expected = {
        ": 0 product second",
        "closeHandle: 0 product second",
        "closeKey: 0 product second",
        "commit: 4321 product second",
        "deleteKey: 0 product first second",
        "deleteKey: 0 product second",
        "deleteService: 0 product second",
        // The list ended early: unknown when FIRST was not read yet, the whole product when it was.
        "enumerateKey: 0",
        "enumerateKey: 5021 product first second",
        "enumerateKey: 0 product first second",
        // The walk ended when everything below FIRST was gone; its key is deleted once more by itself.
        "enumerateKey: 0 product second",
        "enumerateValue: 0 product second",
        "openKey: 0 product first second",
        "openKey: 0 product second",
        // FIRST could not be read.
        "openKey: 5021 product first second",
        // SECOND could not be read, so FIRST counts as the last one.
        "openKey: 0",
        "openManager: 0 product second",
        "openService: 0 product second",
        "queryValue: 0",
        "queryValue: 5021 product first second",
        "stopService: 0 product second",
        "writeOutput: 0 product second",
    };
    EXPECT_EQ(outcomes, expected);
}

}  // namespace
}  // namespace kz7::test
