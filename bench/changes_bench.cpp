// Check mode and wanted copies on the embedded store, compared with reading or writing the same rows.
#include <benchmark/benchmark.h>

#include "bench/bare_store.h"
#include "install/admin/ensurer.h"
#include "install/admin/preview.h"
#include "install/src/registry/change_recorder.h"
#include "install/src/registry/change_set.h"
#include "install/src/uselvlkz7reg.h"

namespace kz7 {
namespace {

std::unique_ptr<IPlatform> platformOf(const Scratch& scratch) {
    return hostPlatform({.program = "bench", .stateDirectory = scratch.path(), .ownProcess = false});
}

std::vector<WantedCopy> copies(std::int64_t count) {
    std::vector<WantedCopy> wanted;
    for (std::int64_t copy = 0; copy < count; ++copy) {
        wanted.push_back({"COPY" + std::to_string(copy), "C:\\KZ7"});
    }
    return wanted;
}

// As the command does it, without the reading of its file.
std::size_t ensure(IPlatform& platform, const std::vector<WantedCopy>& wanted) {
    SilentConsole console;
    Ports ports = platform.ports();
    ports.console = &console;
    RecordedPorts recorded(ports, {.wholeServices = true, .holdsCommits = true});
    Ensurer ensurer(recorded.ports(), true, {});
    require(ensurer.plan(wanted).empty() && ensurer.make(wanted) == kSuccess);
    const ChangeCounts counts = recorded.counts();
    require(recorded.commit() == kSuccess);
    return counts.values;
}

Snapshot readProduct(IRegistryStore& registry) {
    std::vector<KeyStart> starts;
    Snapshot snapshot;
    std::string key;
    require(findEverything(registry, false, starts) == kSuccess &&
            readSnapshot(registry, true, starts, snapshot, key) == kSuccess);
    return snapshot;
}

// A store with that many copies; the last one is kept.
const Scratch& storeWith(std::int64_t count) {
    static std::unique_ptr<Scratch> kept;
    static std::int64_t size = -1;
    if (std::exchange(size, count) != count) {
        kept = std::make_unique<Scratch>();
        ensure(*platformOf(*kept), copies(count));
    }
    return *kept;
}

void sizes(benchmark::internal::Benchmark* bench) {
    bench->ArgName("copies")->Arg(1000)->Arg(5000)->Arg(10000)->Arg(100000);
    bench->Iterations(1)->Repetitions(3)->ReportAggregatesOnly()->Unit(benchmark::kMillisecond);
}

void checkOfAnAdd(benchmark::State& state) {
    const std::unique_ptr<IPlatform> platform = platformOf(storeWith(state.range(0)));
    const char* const add[] = {"kz7InstallReg", "-addKZ7Copy", "NEW", "C:\\KZ7"};
    for (auto step : state) {
        Preview preview(*platform, false);
        std::string key;
        require(preview.fill(key) == kSuccess && runTool(preview.ports(), add) == kSuccess);
        require(!preview.changes().empty());
    }
}
BENCHMARK(checkOfAnAdd)->Apply(sizes);

void ensureOfUnchangedCopies(benchmark::State& state) {
    const std::unique_ptr<IPlatform> platform = platformOf(storeWith(state.range(0)));
    const std::vector<WantedCopy> wanted = copies(state.range(0));
    for (auto step : state) {
        require(ensure(*platform, wanted) == 0);
    }
}
BENCHMARK(ensureOfUnchangedCopies)->Apply(sizes);

// The floor of both.
void readingOfTheProduct(benchmark::State& state) {
    const std::unique_ptr<IPlatform> platform = platformOf(storeWith(state.range(0)));
    for (auto step : state) {
        require(!readProduct(platform->registry()).empty());
        platform->registry().commit();
    }
}
BENCHMARK(readingOfTheProduct)->Apply(sizes);

void ensureOfNewCopies(benchmark::State& state) {
    const Scratch scratch;
    const std::unique_ptr<IPlatform> platform = platformOf(scratch);
    const std::vector<WantedCopy> wanted = copies(state.range(0));
    for (auto step : state) {
        require(ensure(*platform, wanted) != 0);
    }
}
BENCHMARK(ensureOfNewCopies)->Apply(sizes);

// The floor: the same rows, whose places are known.
void bareWritesOfNewCopies(benchmark::State& state) {
    const Snapshot rows = readProduct(platformOf(storeWith(state.range(0)))->registry());
    const Scratch scratch;
    BareStore store(scratch);
    for (auto step : state) {
        store.run("BEGIN IMMEDIATE");
        std::vector<std::int64_t> parents;  // by depth
        for (const KeyRecord& row : rows) {
            parents.resize(row.depth);
            const std::string name = row.depth == 0 ? row.name : row.name.substr(row.name.find_last_of('\\') + 1);
            const std::int64_t key = store.addKey(parents.empty() ? 1 : parents.back(), name);
            parents.push_back(key);
            std::int64_t place = 0;
            for (const KeyValue& value : row.values) {
                store.addValue(key, value.name, value.data, ++place);
            }
        }
        store.run("COMMIT");
    }
}
BENCHMARK(bareWritesOfNewCopies)->Apply(sizes);

// A version-8 registry with that many values below its profiles, a hundred to a key.
void fillVersion8(IPlatform& platform, std::int64_t values) {
    for (std::int64_t key = 0; key < values / 100; ++key) {
        const std::string path =
            "SOFTWARE\\NVQ\\KZ7\\PROFILES\\" + std::to_string(key / 30) + "\\P" + std::to_string(key);
        OwnedKey opened(platform.registry());
        require(platform.registry().createKey(KeyHandle::localMachine, path, {}, kKeySetValue, opened.receive()) ==
                kSuccess);
        for (std::int64_t value = 0; value < 100; ++value) {
            require(platform.registry().setValue(opened.get(), "VALUE" + std::to_string(value), ValueType::sz,
                                                 std::string_view("some text of a value\0", 21)) == kSuccess);
        }
    }
    require(platform.registry().commit() == kSuccess);
}

Status runRecorded(IPlatform& platform, std::span<const char* const> arguments, bool isRecorded) {
    MemoryConsole console;
    Ports ports = platform.ports();
    ports.console = &console;
    if (!isRecorded) {
        return runTool(ports, arguments);
    }
    platform.history()->begin(
        {"kz7InstallReg", {arguments.begin() + 1, arguments.end()}, startsPrograms(arguments), 0});
    const Status status = runTool(RecordedPorts(ports, {.wholeServices = true}).ports(), arguments);
    platform.history()->end(status);
    return status;
}

// With its record and without it, the floor.
void migration(benchmark::State& state) {
    const Scratch scratch;
    fillVersion8(*platformOf(scratch), state.range(1));
    const char* const v9[] = {"kz7InstallReg", "-v9", "C:\\KZ9"};
    for (auto step : state) {
        const std::unique_ptr<IPlatform> platform = platformOf(scratch);
        runRecorded(*platform, v9, state.range(0) != 0);
    }
}
BENCHMARK(migration)
    ->ArgNames({"recorded", "values"})
    ->ArgsProduct({{0, 1}, {100000}})
    ->Iterations(1)
    ->Repetitions(3)
    ->Unit(benchmark::kMillisecond);

// What undo does, with its own record; the floor is the recorded migration.
void undoOfAMigration(benchmark::State& state) {
    const Scratch scratch;
    fillVersion8(*platformOf(scratch), state.range(0));
    const char* const v9[] = {"kz7InstallReg", "-v9", "C:\\KZ9"};
    runRecorded(*platformOf(scratch), v9, true);
    for (auto step : state) {
        const std::unique_ptr<IPlatform> platform = platformOf(scratch);
        HistoryChanges kept;
        require(platform->history()->read(1, kept) == kSuccess);
        TouchedRows rows;
        for (const std::string& part : kept.parts) {
            require(rows.add(part));
        }
        const ChangeSet back = inverse(rows.changes());
        std::vector<const Change*> conflicts;
        std::string key;
        require(findConflicts(platform->registry(), true, back, conflicts, key) == kSuccess && conflicts.empty());
        platform->history()->begin({"kz7admin", {"undo", "1"}, false, 1});
        RecordedPorts recorded(platform->ports(), {.wholeServices = true, .holdsCommits = true, .everyKey = true});
        require(applyChangeSet(*recorded.ports().registry, nullptr, back, key) == kSuccess);
        require(recorded.commit() == kSuccess);
    }
}
BENCHMARK(undoOfAMigration)
    ->ArgName("values")
    ->Arg(100000)
    ->Iterations(1)
    ->Repetitions(3)
    ->Unit(benchmark::kMillisecond);

// An add of another location in an open store, with its record and without it.
void addOfTheTool(benchmark::State& state) {
    const Scratch scratch;
    std::int64_t round = 0;
    for (auto step : state) {
        const std::unique_ptr<IPlatform> platform = platformOf(scratch);
        const std::string location = "C:\\KZ7" + std::to_string(++round);
        const char* const add[] = {"kz7InstallReg", "-addKZ7Copy", "COPY1", location.c_str()};
        require(runRecorded(*platform, add, state.range(0) != 0) == kSuccess);
    }
}
BENCHMARK(addOfTheTool)->ArgName("recorded")->Arg(0)->Arg(1)->Iterations(2000)->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace kz7
