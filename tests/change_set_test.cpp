// Change sets: what a run is recorded to change, what a preview foretells and what differs afterwards are one and the
// same, and taking it back gives the state before.
#include "install/src/registry/change_set.h"

#include <random>

#include "install/admin/ensurer.h"
#include "install/admin/formats/change_text.h"
#include "install/admin/preview.h"
#include "install/src/registry/change_recorder.h"
#include "tests/support/fault_sweep.h"
#include "tests/support/reg_text_store.h"

namespace kz7::test {
namespace {

int levelOfCopy(std::uint32_t, void* info) {
    std::strcpy(static_cast<char*>(info), "KZ7 v9.7.100.22");
    return 0;
}

class RandomMachine : public Machine {
public:
    explicit RandomMachine(unsigned seed) : random_(seed) {
        servicesLeftOpen = 1000;
        libraries_.libraries["C:\\a\\bin\\kz7install64.dll"]["sqleGetLevelInfo"] =
            reinterpret_cast<LibraryFunction>(levelOfCopy);
        files_.add("C:\\a\\bin\\kz7mgmtsvc.exe");
        assemblies_.files = {"kz7nmpx.dll"};
        for (std::size_t step = random_() % 12; step > 0; --step) {
            if (random_() % 3 == 0) {
                addRow();
            } else {
                run(command());
            }
        }
    }

    std::vector<std::string> command() {
        const std::string name = pick({"A", "b", "B", "kz7build", "two words", "9.7", "KZ7V8", "x\\y", ""});
        const std::string location = pick({"C:\\a", "C:\\b\\", "", "D:\\データ"});
        return pick<std::vector<std::string>>({{"-addKZ7Copy", name, location},
                                               {"-addKZ7Copy", name, location},
                                               {"-addv9", name, location},
                                               {"-removeKZ7Copy", name},
                                               {"-v9", location},
                                               {"-v8", location},
                                               {"-dotnet", location}});
    }

private:
    template <typename Item = std::string>
    Item pick(const std::vector<Item>& items) {
        return items[random_() % items.size()];
    }

    void addRow() {
        const std::string key = pick(
            {"SOFTWARE\\NVQ\\KZ7", "SOFTWARE\\NVQ\\KZ7\\InstalledCopies", "SOFTWARE\\NVQ\\KZ7\\GLOBAL_PROFILE\\deep",
             "SOFTWARE\\NVQ\\KZ7\\Components", "SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies",
             "SOFTWARE\\NVQ\\KZ7BackupV8\\PROFILES", "SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC_A\\Parameters",
             "SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC"});
        make(key, pick({"", "a class"}));
        setRaw(key, pick({"", "9", "9.7", "10.1", "Version", "MULTI_VERSION_SUPPORT", "kz7 path name"}),
               pick({std::string(), std::string("B\0", 2), std::string("text"), std::string("\0\xff", 2)}),
               pick<ValueType>({ValueType::sz, ValueType::binary, ValueType::dword}));
    }

    std::mt19937 random_;
};

std::string jsonOf(const ChangeSet& changes) {
    std::string json;
    appendChangesJson(changes, json);
    return json;
}

Snapshot snapshotOf(IRegistryStore& registry) {
    Snapshot snapshot;
    std::string key;
    EXPECT_EQ(readSnapshot(registry, true, {{{KeyHandle::localMachine, {}}, {}}}, snapshot, key), kSuccess) << key;
    return snapshot;
}

TEST(ChangeSet, IsTheSameRecordedForetoldAndSeenAfterwards) {
    for (unsigned seed = 0; seed < 1500; ++seed) {
        RandomMachine machine(seed);
        const std::vector<std::string> command = machine.command();
        std::string shown = "seed " + std::to_string(seed) + ":";
        std::vector<const char*> arguments = {"kz7InstallReg"};
        for (const std::string& word : command) {
            arguments.push_back(word.c_str());
            shown += " " + word;
        }
        SCOPED_TRACE(shown);
        const std::string exported = exportAll(machine.registry_);
        const Snapshot before = snapshotOf(machine.registry_);
        std::string key;
        ChangeSet foretold;
        {
            Preview preview(machine, true);
            ASSERT_EQ(preview.fill(key), kSuccess) << key;
            runTool(preview.ports(), arguments);
            foretold = preview.changes();
        }
        EXPECT_EQ(exportAll(machine.registry_), exported) << "a preview changed something";

        ChangeSet recorded;
        {
            RecordedPorts ports(machine.ports(), true);
            runTool(ports.ports(), arguments);
            EXPECT_EQ(ports.status(), kSuccess);
            recorded = ports.changes();
        }
        const std::string seen = jsonOf(difference(before, snapshotOf(machine.registry_)));
        ASSERT_EQ(jsonOf(recorded), seen);
        ASSERT_EQ(jsonOf(foretold), seen);

        const ChangeSet back = inverse(recorded);
        std::vector<const Change*> conflicts;
        EXPECT_EQ(findConflicts(machine.registry_, true, back, conflicts, key), kSuccess) << key;
        EXPECT_TRUE(conflicts.empty()) << conflicts.front()->key;
        EXPECT_EQ(applyChangeSet(machine.registry_, nullptr, back, key), kSuccess) << key;
        ASSERT_EQ(exportAll(machine.registry_), exported);

        // Taken back already, it cannot be taken back again.
        EXPECT_EQ(findConflicts(machine.registry_, true, back, conflicts, key), kSuccess);
        EXPECT_EQ(conflicts.empty(), back.empty());
    }
}

// Every call of an ensure fails in turn: what was made is recorded, or the record tells that it has gaps, and a run
// that succeeds has made what a run without a fault makes.
TEST(ChangeSet, IsRecordedWhateverFails) {
    const std::vector<WantedCopy> wanted = {{"FIRST", "C:\\moved"}, {"THIRD", "C:\\third"}, {"SECOND", "", false}};
    const auto prepare = [](FaultyMachine& machine) {
        machine.run({"-addKZ7Copy", "FIRST", "C:\\first"});
        machine.run({"-addKZ7Copy", "SECOND", "C:\\second"});
    };
    for (const bool forGood : {false, true}) {
        Snapshot before;
        ChangeSet recorded;
        Status gaps = kSuccess;
        std::string reached;  // by the runs that succeeded
        const auto ensure = [&](FaultyMachine& machine) {
            before = snapshotOf(machine.registry_);
            RecordedPorts ports(machine.ports(), true, true);
            Ensurer ensurer(ports.ports(), true, {.services = true});
            const std::string refusal = ensurer.plan(wanted);
            const Status status = refusal.empty() ? ensurer.make(wanted) : kFailed;
            recorded = ports.changes();
            gaps = ports.status();
            return status;
        };
        const auto check = [&](FaultyMachine& machine, Status status) {
            EXPECT_TRUE(gaps != kSuccess ||
                        jsonOf(recorded) == jsonOf(difference(before, snapshotOf(machine.registry_))));
            if (status == kSuccess) {
                // A failed close of a service changes nothing of what is reached.
                const std::string found = exportAll(machine.registry_);
                EXPECT_TRUE(found == reached || reached.empty());
                reached = found;
            }
        };
        EXPECT_GT(sweepFaults(forGood, prepare, ensure, check), 100U);
        EXPECT_NE(reached, "");
    }
}

}  // namespace
}  // namespace kz7::test
