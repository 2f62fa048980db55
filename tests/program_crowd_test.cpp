// Concurrent runs, and runs that are killed or whose system calls fail: what was reported is never lost, and a store
// never holds half a run.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <future>
#include <random>
#include <set>

#include "install/platform/platform.h"
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

TEST_P(Crowd, ConcurrentAddsLoseNothing) {
    constexpr int kRuns = 200;
    const StateDirectory state;
    std::vector<std::future<std::string>> processes;
    for (std::size_t process = 0; process < GetParam(); ++process) {
        processes.push_back(std::async(std::launch::async, [&, process] {
            std::string faults;
            for (int run = 0; run < kRuns; ++run) {
                const ProgramResult result = state.tool({"-addKZ7Copy", copyName(process, run), "C:\\KZ7"});
                faults += result.error + (result.exitCode == 0 ? "" : copyName(process, run) + " failed\n");
            }
            return faults;
        }));
    }
    for (std::future<std::string>& process : processes) {
        EXPECT_EQ(process.get(), "");
    }
    const std::string found = state.dump();
    const std::size_t copies = GetParam() * kRuns;
    EXPECT_EQ(occurrences(found, "KZ7 Path Name = 1:C:\\KZ7\\x00\n"), 2 * copies);
    EXPECT_EQ(occurrences(found, "_PROFILES :  = 1:\\x00\n"), 2 * copies);
    EXPECT_EQ(occurrences(found, "DisplayName = 1:KZ7 Management Service ("), copies);
    EXPECT_EQ(state.integrity(), "ok");
}

TEST(Race, ACopyThatIsRemovedWhileItsVariablesAreSetDoesNotComeBack) {
    const StateDirectory start;
    for (const Arguments& command : {kAddFirst, kAddSecond}) {
        ASSERT_EQ(start.tool(command).exitCode, 0);
    }
    const StateDirectory removed;
    removed.copyFrom(start);
    ASSERT_EQ(removed.tool({"-removeKZ7Copy", "FIRST"}).exitCode, 0);
    overwrite(start.file("responses"), "KZ7COMM = TCPIP\n");
    for (int round = 0; round < 60; ++round) {
        const StateDirectory state;
        state.copyFrom(start);
        const pid_t removal = state.start({"-removeKZ7Copy", "FIRST"});
        state.run("kz7admin", {"commit", "--copy", "FIRST", "--response-file", state.file("responses")});
        int status = 0;
        waitpid(removal, &status, 0);
        EXPECT_EQ(status, 0);
        EXPECT_EQ(state.dump(), removed.dump()) << "round " << round;
    }
}

INSTANTIATE_TEST_SUITE_P(Processes, Crowd, testing::Values(2, 8));

// The location of the sample copy, whose programs can look at the store during a run.
const std::string kSample = KZ7_SAMPLE;

// A command that is killed at random moments. Adding a flow is adding a row.
struct KilledFlow {
    const char* name;
    std::vector<Arguments> before;  // commands that create the initial state
    Arguments command;
    bool isDamaged = false;  // the store is damaged before the command
};

std::vector<Arguments> manyAdds() {
    std::vector<Arguments> adds(14);
    for (int run = 0; Arguments & add : adds) {
        add = {"-addKZ7Copy", copyName(0, run++), "C:\\KZ7"};
    }
    return adds;
}

// Files for kz7admin: a list of copies, and a registry with three of them.
const TemporaryDirectory kDocuments;
const std::string kList = kDocuments.path() + "/copies.json";
const std::string kRegistry = kDocuments.path() + "/wanted.reg";
const std::string kDamage = kDocuments.path() + "/damage.reg";

void writeDocuments() {
    std::string list = "{\"copies\": [";
    for (int copy = 0; copy < 50; ++copy) {
        list += "{\"name\": \"" + copyName(1, copy) + "\", \"location\": \"C:\\\\KZ7\"},";
    }
    overwrite(kList, list + "{\"name\": \"FIRST\", \"state\": \"absent\"}]}");
    const StateDirectory other;
    for (int copy = 0; copy < 3; ++copy) {
        other.tool({"-addKZ7Copy", copyName(2, copy), "C:\\KZ7"});
    }
    overwrite(kRegistry, other.tool({"export"}).output);
    const std::string copies = "[HKLM\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies";
    overwrite(kDamage, "REGEDIT4\n" + copies + "]\n\"9.7\"=\"GONE\"\n[-" + copies.substr(1) +
                           "\\FIRST\\PROFILES]\n[-HKLM\\SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC_FIRST]\n");
}

const KilledFlow kFlows[] = {
    {"add", {kAddFirst}, kAddSecond},
    {"addToAnEmptyMachine", {}, kAddFirst},
    {"addWithACheckpoint", manyAdds(), kAddFirst},
    {"remove", {kAddFirst, kAddSecond}, {"-removeKZ7Copy", "SECOND"}},
    {"removeTheLast", {kAddFirst}, {"-removeKZ7Copy", "FIRST"}},
    {"version8", {kAddFirst}, {"-v8", "C:\\KZ8"}},
    {"version9", {{"-v8", "C:\\KZ8"}}, {"-v9", kSample}},
    {"backToVersion8", {{"-v8", "C:\\KZ8"}, {"-v9", kSample}}, {"-v8", "C:\\KZ8"}},
    {"dotnet", {kAddFirst}, {"-dotnet", kSample}},
    {"ensure", {kAddFirst}, {"ensure", "--from", kList}},
    {"restore", {kAddFirst}, {"restore", kRegistry}},
    {"import", {kAddFirst}, {"import", kRegistry}},
    {"repair", {kAddFirst, {"import", kDamage}}, {"repair", "aliases", "copies", "services"}},
    {"restoreADamagedStore", {kAddFirst}, {"restore", kRegistry}, true},
    {"undo", {kAddFirst, kAddSecond}, {"undo", "2"}},
    {"undoOfAMigration", {{"-v8", "C:\\KZ8"}, {"-v9", kSample}}, {"undo", "2"}},
};

// Two commands at once leave what one after the other leaves, in one of the two orders.
TEST(Race, CommandsTakeTurns) {
    writeDocuments();
    const Arguments ensure = {"ensure", "--from", kList};
    const Arguments restore = {"restore", kRegistry};
    const std::pair<Arguments, Arguments> pairs[] = {
        {ensure, kAddSecond}, {restore, kAddSecond}, {ensure, restore}, {restore, {"-removeKZ7Copy", "FIRST"}}};
    const StateDirectory start;
    ASSERT_EQ(start.tool(kAddFirst).exitCode, 0);
    for (const auto& [one, other] : pairs) {
        std::set<std::string> orders;
        for (const auto& [first, second] : {std::pair{one, other}, std::pair{other, one}}) {
            const StateDirectory state;
            state.copyFrom(start);
            state.tool(first);
            state.tool(second);
            orders.insert(state.dump());
        }
        for (int round = 0; round < 10; ++round) {
            const StateDirectory state;
            state.copyFrom(start);
            const pid_t child = state.start(one);
            state.tool(other);
            int status = 0;
            waitpid(child, &status, 0);
            EXPECT_TRUE(orders.contains(state.dump())) << one.front() << " and " << other.front();
        }
    }
}

bool hasUnfinishedStore(const StateDirectory& state) {
    const std::filesystem::directory_iterator files(state.path());
    return std::any_of(begin(files), end(files), [](const auto& file) {
        const std::string name = file.path().filename().string();
        return name.starts_with("registry.db.") && !name.starts_with("registry.db.old");
    });
}

// The committed states that the child programs of a command see.
std::set<std::string> statesOfChildren(const StateDirectory& start, const Arguments& command) {
    const StateDirectory state;
    state.copyFrom(start);
    const TemporaryDirectory seen;
    const std::string hook = "KZ7_SAMPLE_HOOK=cp -r " + state.path() + " " + seen.path() + "/$$";
    EXPECT_EQ(state.tool(command, {{hook}, {}}).exitCode, 0);
    std::set<std::string> states;
    for (const auto& entry : std::filesystem::directory_iterator(seen.path())) {
        states.insert(StateDirectory::wholeOf(entry.path()));
    }
    return states;
}

class Kills : public testing::TestWithParam<KilledFlow> {
protected:
    void SetUp() override {
        writeDocuments();
        for (const auto& command : flow_.before) {
            ASSERT_EQ(start_.tool(command).exitCode, 0);
        }
        if (flow_.isDamaged) {
            overwrite(start_.file("registry.db"), std::string(20000, '?'));
        }
        done_.copyFrom(start_);
        const auto begun = std::chrono::steady_clock::now();
        ASSERT_EQ(done_.tool(flow_.command).exitCode, 0);
        usual_ = std::chrono::steady_clock::now() - begun;
        after_ = StateDirectory::wholeOf(done_.path());
        ASSERT_NE(StateDirectory::wholeOf(start_.path()), after_);
        unfinished_ = statesOfChildren(start_, flow_.command);
        unfinished_.insert(StateDirectory::wholeOf(start_.path()));
        unfinished_.erase(after_);
    }

    const KilledFlow& flow_ = GetParam();
    const StateDirectory start_{};
    const StateDirectory done_{};
    std::chrono::nanoseconds usual_{};  // the time of a whole run
    std::string after_;
    std::set<std::string> unfinished_;  // states that were committed before the last one
};

TEST_P(Kills, LeaveAStateThatWasCommitted) {
    // A soak test asks for more; this number reaches every part of a run.
    const char* const asked = std::getenv("KZ7_KILLS");
    const int kills = asked == nullptr ? 100 : std::atoi(asked);
    std::mt19937_64 random(20240607);
    int killed = 0;
    for (int round = 0; round < kills; ++round) {
        const StateDirectory state;
        state.copyFrom(start_);
        const pid_t child = state.start(flow_.command);
        const std::chrono::nanoseconds moment(random() % static_cast<std::uint64_t>(usual_.count()));
        // A busy wait: the moments of interest are microseconds apart.
        for (const auto from = std::chrono::steady_clock::now(); std::chrono::steady_clock::now() - from < moment;) {
        }
        kill(child, SIGKILL);
        int status = 0;
        waitpid(child, &status, 0);
        const std::string found = StateDirectory::wholeOf(state.path());
        killed += WIFSIGNALED(status) ? 1 : 0;
        EXPECT_TRUE(found == after_ || (WIFSIGNALED(status) && unfinished_.contains(found)))
            << "round " << round << found;
        if (found != after_) {
            EXPECT_EQ(state.tool(flow_.command).exitCode, 0) << "round " << round;
        }
        EXPECT_EQ(state.integrity(), "ok") << "round " << round;
        EXPECT_FALSE(hasUnfinishedStore(state)) << "round " << round;
    }
    EXPECT_GT(killed, kills / 20);
}

// The same with each call of a kind that fails because the disk or the memory is full: the exit code tells which state
// remains. Allocations fail in one flow only, because every run has hundreds of them; one that fails after the commit
// fails the run, as does the last sync of a new store that is in its place.
TEST_P(Kills, FailedCallsLeaveTheStateThatTheExitCodeTells) {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    GTEST_SKIP() << "a sanitizer's library must be the first one that is loaded";
#endif
    const std::string preloaded = "LD_PRELOAD=" + std::string(KZ7_FAILING_CALLS);
    for (const std::string kind : {"sync", "pwrite", "ftruncate", "rename", "open", "mkdir", "malloc"}) {
        for (const std::string forGood : {"0", "1"}) {
            bool failed = kind != "malloc" || flow_.command == kAddSecond;
            for (int call = 1; failed && !HasFailure(); ++call) {
                const std::string row = kind + " " + std::to_string(call) + (forGood == "1" ? " for good" : "");
                const StateDirectory state;
                state.copyFrom(start_);
                const ProgramResult result =
                    state.tool(flow_.command, {{preloaded, "KZ7_FAIL_CALL=" + kind,
                                                "KZ7_FAIL_AT=" + std::to_string(call), "KZ7_FAIL_FOR_GOOD=" + forGood},
                                               {}});
                failed = result.error.find("a call fails\n") != std::string::npos;
                const std::string found = StateDirectory::wholeOf(state.path());
                const bool isLate = (kind == "malloc" || (flow_.isDamaged && kind == "sync")) && found == after_;
                EXPECT_TRUE(result.exitCode == 0 ? found == after_ : failed && (unfinished_.contains(found) || isLate))
                    << row << ": " << result.exitCode << found << result.error;
                EXPECT_GE(result.exitCode, 0) << row;
                EXPECT_TRUE(result.exitCode == 0 || flow_.command != kAddSecond ||
                            result.output.find("added successfully") == std::string::npos)
                    << row << result.output;
                const bool isTool = flow_.command.front().starts_with('-');
                EXPECT_TRUE(!isTool || result.exitCode == 0 || kind != "sync" ||
                            result.exitCode == hostExitCode(kDiskFull))
                    << row << ": " << result.exitCode << result.error;
                const bool isAsBefore = found.empty() || (flow_.isDamaged && found != after_);
                EXPECT_TRUE(isAsBefore || state.integrity() == "ok") << row;
                EXPECT_FALSE(hasUnfinishedStore(state)) << row;
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Flows, Kills, testing::ValuesIn(kFlows),
                         [](const testing::TestParamInfo<KilledFlow>& row) { return row.param.name; });

}  // namespace
}  // namespace kz7::test
