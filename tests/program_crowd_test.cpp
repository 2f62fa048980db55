// Many runs at once, and runs that are killed: nothing is lost that was reported, nothing is ever half there.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <random>
#include <set>
#include <thread>

#include "install/platform/embedded/registry.h"
#include "tests/support/registry_dump.h"
#include "tests/support/state_directory.h"

namespace kz7::test {
namespace {

std::size_t occurrences(const std::string& text, const std::string& part) {
    std::size_t count = 0;
    for (std::size_t at = 0; (at = text.find(part, at)) != std::string::npos; at += part.size()) {
        ++count;
    }
    return count;
}

std::string copyName(std::size_t process, int run) {
    return "P" + std::to_string(process) + "R" + std::to_string(run);
}

class Crowd : public testing::TestWithParam<std::size_t> {};

TEST_P(Crowd, AddsAtTheSameTimeOnAnEmptyMachineLoseNothing) {
    constexpr int kRuns = 200;
    const StateDirectory state;
    std::vector<std::thread> processes;
    std::vector<std::string> faults(GetParam());
    for (std::size_t process = 0; process < GetParam(); ++process) {
        processes.emplace_back([&, process] {
            for (int run = 0; run < kRuns; ++run) {
                const ProgramResult result = state.tool({"-addKZ7Copy", copyName(process, run), "C:\\KZ7"});
                faults[process] += result.exitCode == 0 ? result.error : copyName(process, run) + result.error + "\n";
            }
        });
    }
    for (std::thread& process : processes) {
        process.join();
    }
    for (const std::string& fault : faults) {
        EXPECT_EQ(fault, "");
    }
    const std::string found = state.dump();
    const std::size_t copies = GetParam() * kRuns;
    EXPECT_EQ(occurrences(found, "KZ7 Path Name = 1:C:\\KZ7\\x00\n"), 2 * copies);
    EXPECT_EQ(occurrences(found, "DAS_PROFILES :  = 1:\\x00\n") + occurrences(found, "Das_PROFILES :  = 1:\\x00\n"),
              2 * copies);
    EXPECT_EQ(occurrences(found, "DisplayName = 1:KZ7 Management Service ("), copies);
    EXPECT_EQ(state.integrity(), "ok");
}

INSTANTIATE_TEST_SUITE_P(Processes, Crowd, testing::Values(2, 8));

// The sample copy's location; its programs can be made to look at the store that they were started on.
const std::string kSample = KZ7_SAMPLE;

// A command that is killed at random moments. Adding a flow is adding a row.
struct KilledFlow {
    const char* name;
    std::vector<std::vector<std::string>> before;  // commands that make the state it starts from
    std::vector<std::string> command;
};

class Kills : public testing::TestWithParam<KilledFlow> {};

const std::vector<std::string> kAddFirst = {"-addKZ7Copy", "FIRST", "C:\\KZ7\\first"};
const std::vector<std::string> kAddSecond = {"-addKZ7Copy", "SECOND", "C:\\KZ7\\second"};

const KilledFlow kFlows[] = {
    {"add", {kAddFirst}, kAddSecond},
    {"addToAnEmptyMachine", {}, kAddFirst},
    {"remove", {kAddFirst, kAddSecond}, {"-removeKZ7Copy", "SECOND"}},
    {"removeTheLast", {kAddFirst}, {"-removeKZ7Copy", "FIRST"}},
    {"version8", {kAddFirst}, {"-v8", "C:\\KZ8"}},
    {"version9", {{"-v8", "C:\\KZ8"}}, {"-v9", kSample}},
    {"backToVersion8", {{"-v8", "C:\\KZ8"}, {"-v9", kSample}}, {"-v8", "C:\\KZ8"}},
    {"dotnet", {kAddFirst}, {"-dotnet", kSample}},
};

// How often each flow is killed: KZ7_KILLS for a soak, else enough to meet every part of a run.
int killCount() {
    const char* asked = std::getenv("KZ7_KILLS");
    return asked == nullptr ? 100 : std::atoi(asked);
}

// The states in which a command starts its child programs: committed ones, so that the programs see them.
std::set<std::string> statesOfChildren(const StateDirectory& start, const std::vector<std::string>& command) {
    const StateDirectory state;
    state.copyFrom(start);
    const TemporaryDirectory seen;
    const std::string hook = "KZ7_SAMPLE_HOOK=cp -r " + state.path() + " " + seen.path() + "/$$";
    EXPECT_EQ(state.tool(command, {{hook}, {}}).exitCode, 0);
    std::set<std::string> states;
    for (const auto& entry : std::filesystem::directory_iterator(seen.path())) {
        EmbeddedRegistry registry(entry.path(), true, [](const StoreFault&) {});
        states.insert(dumpRegistry(registry));
    }
    return states;
}

TEST_P(Kills, LeaveAStateThatWasCommitted) {
    const KilledFlow& flow = GetParam();
    const StateDirectory start;
    for (const auto& command : flow.before) {
        ASSERT_EQ(start.tool(command).exitCode, 0);
    }
    const StateDirectory done;
    done.copyFrom(start);
    const auto begun = std::chrono::steady_clock::now();
    ASSERT_EQ(done.tool(flow.command).exitCode, 0);
    const auto usual = std::chrono::steady_clock::now() - begun;
    const std::string after = done.dump();
    const std::string before = start.dump();
    ASSERT_NE(before, after);
    std::set<std::string> allowed = statesOfChildren(start, flow.command);
    allowed.insert({before, after});

    std::mt19937_64 random(20240607);
    int killed = 0;
    for (int round = 0; round < killCount(); ++round) {
        const StateDirectory state;
        state.copyFrom(start);
        const pid_t child = state.start(flow.command);
        const auto moment = random() % static_cast<std::uint64_t>(std::chrono::nanoseconds(usual).count());
        // A busy wait: the moments of interest are microseconds apart.
        for (const auto from = std::chrono::steady_clock::now();
             std::chrono::steady_clock::now() - from < std::chrono::nanoseconds(moment);) {
        }
        kill(child, SIGKILL);
        int status = 0;
        waitpid(child, &status, 0);
        const std::string found = state.dump();
        if (WIFSIGNALED(status)) {
            ++killed;
            EXPECT_TRUE(allowed.contains(found)) << "round " << round << "\n" << found;
        } else {
            EXPECT_EQ(found, after) << "round " << round;
        }
        if (found != after) {
            EXPECT_EQ(state.tool(flow.command).exitCode, 0) << "round " << round;
        }
        EXPECT_EQ(state.integrity(), "ok") << "round " << round;
    }
    EXPECT_GT(killed, killCount() / 20);
}

INSTANTIATE_TEST_SUITE_P(Flows, Kills, testing::ValuesIn(kFlows),
                         [](const testing::TestParamInfo<KilledFlow>& row) { return row.param.name; });

// The log of a store that lost its end, as after a power cut on a disk that had not written it yet, or that has
// noise there: what is left is the state after some whole run, and the next run works.
TEST(LogFile, ACutOrNoisyEndLeavesWholeRuns) {
    constexpr int kRuns = 6;
    const StateDirectory start;
    std::vector<std::string> states;
    for (int run = 0; run < kRuns; ++run) {
        ASSERT_EQ(start.tool({"-addKZ7Copy", copyName(0, run), "C:\\KZ7"}).exitCode, 0);
        states.push_back(start.dump());
    }
    const std::string log = contents(start.file("registry.db-wal"));
    ASSERT_GT(log.size(), 10000U);
    std::mt19937_64 random(7);
    for (int round = 0; round < 60; ++round) {
        const StateDirectory state;
        state.copyFrom(start);
        const std::size_t kept = std::uniform_int_distribution<std::size_t>(0, log.size())(random);
        const bool noisy = round % 3 != 0;
        std::string spoiled = log.substr(0, kept);
        for (std::size_t at = 0; noisy && at < 5000; ++at) {
            spoiled += static_cast<char>(random());
        }
        overwrite(state.file("registry.db-wal"), spoiled);
        const std::string found = state.dump();
        EXPECT_TRUE(found.empty() || std::find(states.begin(), states.end(), found) != states.end())
            << "kept " << kept << " bytes of the log\n"
            << found;
        EXPECT_EQ(state.tool({"-addKZ7Copy", "NEXT", "C:\\KZ7"}).exitCode, 0);
        EXPECT_EQ(state.integrity(), "ok");
    }
    overwrite(start.file("registry.db-wal"), log + std::string(5000, '\xA5'));
    EXPECT_EQ(start.dump(), states.back()) << "noise behind the log's end cost a run that was reported";
}

}  // namespace
}  // namespace kz7::test
