// Change sets: what a run is recorded to change, what a preview foretells and what differs afterwards are one and the
// same, and taking it back gives the state before.
#include "install/src/registry/change_set.h"

#include <random>

#include "install/admin/ensurer.h"
#include "install/admin/formats/change_text.h"
#include "install/admin/preview.h"
#include "install/admin/repair.h"
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
    // In order, with a location that has everything.
    RandomMachine() {
        servicesLeftOpen = 1000;
        libraries_.libraries["C:\\a\\bin\\kz7install64.dll"]["sqleGetLevelInfo"] =
            reinterpret_cast<LibraryFunction>(levelOfCopy);
        files_.add("C:\\a\\bin\\kz7mgmtsvc.exe");
        files_.add("C:\\a\\bin\\kz7nmpx.dll");
    }
    explicit RandomMachine(unsigned seed) : RandomMachine() {
        random_.seed(seed);
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

    // What a flow never leaves: rows that are gone, changed or foreign.
    void damage() {
        for (std::size_t step = random_() % 8; step > 0; --step) {
            const std::string view =
                pick({"SOFTWARE\\NVQ\\KZ7\\InstalledCopies", "SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies"});
            const std::string copy = view + '\\' + pick({"A", "b", "kz7build", "two words", "debris"});
            const std::string key =
                copy + pick({"", "\\Components", "\\CurrentVersion", "\\GLOBAL_PROFILE", "\\PROFILES"});
            const std::string service = "SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC_" + pick({"A", "b", "ghost"});
            switch (random_() % 7) {
                case 0:
                    deleteTree(registry_, KeyHandle::localMachine, pick({key, view, service}), 0, {}, {});
                    break;
                case 1:
                    set(key,
                        pick({"KZ7 Path Name", "KZ7PATH", "Version", "Release", "Service Level", "Fix Level", "own"}),
                        pick({"", "10", "C:\\other place", std::string(300, 'p')}));
                    break;
                case 2:
                    setRaw(view, pick({"9", "9.7", "9.6", "8", std::string(100, '9'), std::string(101, 'x')}),
                           pick({std::string(), std::string("B"), std::string(120, 'n'), std::string("GONE\0", 5)}),
                           pick<ValueType>({ValueType::sz, ValueType::binary}));
                    break;
                case 3:
                    set(service, "ImagePath", pick({"C:\\a b\\x.exe", "C:\\a\\bin\\kz7mgmtsvc.exe"}));
                    files_.add("C:\\a.exe");
                    break;
                case 4:
                    setRaw(service, "Start", std::string("\4\0\0\0", 4), ValueType::dword);
                    break;
                case 5:
                    setText(registry_, "SOFTWARE\\NVQ\\KZ7BackupV8\\PROFILES", "v", "8");
                    break;
                default:
                    OwnedKey saved(registry_);
                    registry_.createKey(KeyHandle::users, "S-1\\SOFTWARE\\NVQ\\KZ7\\TEMP\\PROPERTIES95", {}, kKeyFull,
                                        saved.receive());
            }
        }
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
    JsonWriter json;
    appendChanges(changes, json);
    return json.take();
}

Snapshot snapshotOf(IRegistryStore& registry) {
    Snapshot snapshot;
    std::string key;
    EXPECT_EQ(readSnapshot(registry, true, {{{KeyHandle::localMachine, {}}, {}}}, snapshot, key), kSuccess) << key;
    return snapshot;
}

// Keeps what it is given.
class KeptHistory final : public IHistory {
public:
    explicit KeptHistory(bool takesEach) : takesEach_(takesEach) {}

    bool isOn() override { return true; }
    Status turn(bool) override { return kSuccess; }
    void begin(const HistoryStart&) override {}
    bool takesEachChange() override { return takesEach_; }
    Status append(std::string part) override {
        EXPECT_TRUE(rows.add(part));
        return kSuccess;
    }
    Status settle(const ChangeCounts& given) override {
        counts = given;
        return kSuccess;
    }
    void note(std::string_view) override {}
    void end(Status) override {}
    Status list(std::vector<HistoryRun>&) override { return kSuccess; }
    Status read(std::uint64_t, HistoryChanges&) override { return kSuccess; }
    Status trim(std::uint64_t) override { return kSuccess; }

    TouchedRows rows;
    ChangeCounts counts;

private:
    bool takesEach_;
};

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
        KeptHistory history(seed % 2 == 0);
        {
            Ports real = machine.ports();
            real.history = &history;
            RecordedPorts ports(real, {.wholeServices = true});
            runTool(ports.ports(), arguments);
            EXPECT_EQ(ports.status(), kSuccess);
            recorded = ports.changes();
        }
        const std::string seen = jsonOf(difference(before, snapshotOf(machine.registry_)));
        ASSERT_EQ(jsonOf(recorded), seen);
        ASSERT_EQ(jsonOf(foretold), seen);
        ASSERT_EQ(jsonOf(history.rows.changes()), seen);
        const ChangeCounts counts = countChanges(recorded);
        EXPECT_EQ(std::tie(history.counts.values, history.counts.keys, history.counts.services),
                  std::tie(counts.values, counts.keys, counts.services));
        const std::string after = exportAll(machine.registry_);

        const ChangeSet back = inverse(recorded);
        std::vector<const Change*> conflicts;
        EXPECT_EQ(findConflicts(machine.registry_, true, back, conflicts, key), kSuccess) << key;
        EXPECT_TRUE(conflicts.empty()) << conflicts.front()->key;
        RecordedPorts undo(machine.ports(), {.wholeServices = true, .holdsCommits = true});
        EXPECT_EQ(applyChangeSet(*undo.ports().registry, nullptr, back, key), kSuccess) << key;
        ASSERT_EQ(exportAll(machine.registry_), exported);

        // Taken back already, it cannot be taken back again.
        EXPECT_EQ(findConflicts(machine.registry_, true, back, conflicts, key), kSuccess);
        EXPECT_EQ(conflicts.empty(), back.empty());

        const ChangeSet redo = inverse(undo.changes());
        EXPECT_EQ(findConflicts(machine.registry_, true, redo, conflicts = {}, key), kSuccess);
        EXPECT_TRUE(conflicts.empty());
        EXPECT_EQ(applyChangeSet(machine.registry_, nullptr, redo, key), kSuccess) << key;
        ASSERT_EQ(exportAll(machine.registry_), after);
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
            RecordedPorts ports(machine.ports(), {.wholeServices = true, .holdsCommits = true});
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

MachineState stateOf(IRegistryStore& registry) {
    MachineState state;
    std::string key;
    EXPECT_EQ(readMachine(registry, Depth::whole, state, key), kSuccess) << key;
    return state;
}

// After a repair the check finds nothing of its kind but what no record can tell, and the inverse brings the damage
// back.
TEST(Repair, LeavesNothingOfItsKindAndCanBeTakenBack) {
    std::map<std::string_view, std::size_t> repaired;
    for (unsigned seed = 0; seed < 1500; ++seed) {
        const std::string_view group =
            std::array<std::string_view, 5>{"aliases", "copies", "services", "properties", "migration"}[seed % 5];
        SCOPED_TRACE(std::string(group) + ", seed " + std::to_string(seed));
        RandomMachine machine(seed);
        machine.damage();
        const std::string damaged = exportAll(machine.registry_);
        const auto isOfGroup = [&](const Finding& finding) { return finding.kind().group == group; };
        const auto found = findFindings(stateOf(machine.registry_), machine.files_, false);
        ChangeSet changes;
        std::vector<Finding> rest;
        std::string key;
        {
            RecordedPorts ports(machine.ports(), {.wholeServices = true, .holdsCommits = true});
            const RepairRequest request{{group}, {}, {}, {}, group == "migration"};
            ASSERT_EQ(repairMachine(ports.ports(), true, request, rest, key), kSuccess) << key;
            changes = ports.changes();
        }
        EXPECT_TRUE(machine.processes_.started.empty());
        repaired[group] += std::any_of(found.begin(), found.end(), isOfGroup) ? 1 : 0;
        const MachineState after = stateOf(machine.registry_);
        for (const Finding& finding : findFindings(after, machine.files_, false)) {
            const CopyRow* const copy = after.find(finding.copy);
            const bool isKnown = copy == nullptr || !copy->shown().location.empty();
            EXPECT_FALSE(isOfGroup(finding) && isKnown) << findingLine(finding);
        }
        ASSERT_EQ(applyChangeSet(machine.registry_, nullptr, inverse(changes), key), kSuccess) << key;
        ASSERT_EQ(exportAll(machine.registry_), damaged);
    }
    for (const auto& [group, count] : repaired) {
        EXPECT_GT(count, 20U) << group;
    }
}

// Installers give a copy one location, and go back to version 8 before they remove copies.
TEST(Check, IsSilentAfterEveryOptionOnAMachineInOrder) {
    for (unsigned seed = 0; seed < 300; ++seed) {
        std::mt19937 random(seed);
        RandomMachine machine;
        std::string shown;
        for (int step = 0; step < 12; ++step) {
            const std::string name = std::array{"A", "B", "COPY9", "COPY10"}[random() % 4];
            const std::vector<std::string> commands[] = {{"-addKZ7Copy", name, "C:\\Program Files\\" + name},
                                                         {"-addKZ7Copy", name, "C:\\Program Files\\" + name},
                                                         {"-removeKZ7Copy", name},
                                                         {"-dotnet", "C:\\a"},
                                                         {"-v9", "C:\\a"},
                                                         {"-removeKZ7Copy", "kz7build"},
                                                         {"-addv9", name, "C:\\Program Files\\" + name}};
            const auto& command =
                step == 0 && seed % 2 == 0 ? std::vector<std::string>{"-v8", "C:\\8"} : commands[random() % 7];
            machine.run(command);
            shown += command[0] + ' ' + command[1] + "; ";
            std::string lines;
            for (const Finding& finding : findFindings(stateOf(machine.registry_), machine.files_, false)) {
                lines += findingLine(finding);
            }
            ASSERT_EQ(lines, "") << shown;
        }
    }
}

// A call that fails ends the check and a repair with a status; a walk over the aliases that fails counts as ended.
TEST(RepairUnderFaults, EndsWithAStatus) {
    const auto prepare = [](FaultyMachine& machine) {
        machine.run({"-addKZ7Copy", "A", "C:\\a"});
        machine.set(std::string(layout::kCopies), "9", "GONE");
        deleteTree(machine.registry_, KeyHandle::localMachine, "SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC_A", 0,
                   {}, {});
        deleteTree(machine.registry_, KeyHandle::localMachine, std::string(layout::kCopies) + "\\A\\PROFILES", 0, {},
                   {});
    };
    const auto repair = [](FaultyMachine& machine) {
        RecordedPorts ports(machine.ports(), {.wholeServices = true, .holdsCommits = true});
        const RepairRequest request{{"aliases", "copies", "services"}, {}, {}, {}, false};
        std::vector<Finding> rest;
        std::string key;
        return repairMachine(ports.ports(), true, request, rest, key);
    };
    const auto check = [](FaultyMachine& machine, Status status) {
        const std::string& failed = machine.faults_.failed();
        const bool mayPass = failed.empty() || failed.starts_with("close") || failed.starts_with("enumerate") ||
                             failed == "probe" || failed == "openKey" || failed == "queryValue";
        EXPECT_TRUE(mayPass || status != kSuccess) << failed;
        EXPECT_TRUE(!failed.empty() || status == kSuccess);
    };
    EXPECT_GT(sweepFaults(false, prepare, repair, check), 100U);
    EXPECT_GT(sweepFaults(true, prepare, repair, check), 100U);
}

}  // namespace
}  // namespace kz7::test
