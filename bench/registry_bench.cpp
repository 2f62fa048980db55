// The registry layer on the embedded store compared with bare SQLite: the writes of an add, copies and deletions of
// trees of three shapes, enumeration by index, the list of copies.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "bench/bare_store.h"
#include "install/platform/embedded/ports.h"
#include "install/platform/embedded/registry.h"
#include "install/platform/service_records.h"
#include "install/src/copies/copy_list.h"
#include "install/src/held_console.h"
#include "install/src/registry/registry_access.h"
#include "install/src/version8.h"
#include "install/src/version9.h"

namespace kz7 {
namespace {

EmbeddedRegistry openStore(const Scratch& scratch) {
    return {scratch.path(), false, [](const StoreFault&) { std::abort(); }};
}

// Shapes of a tree with about `count` values below SOURCE: up to a hundred to a key in a balanced tree, one in
// each of as many keys under one parent, all in one key.
enum Shape { balanced, wide, flat };

void fillBalanced(BareStore& store, std::int64_t key, std::int64_t count) {
    const std::int64_t here = count <= 100 ? count : 10;
    for (std::int64_t i = 0; i < here; ++i) {
        store.addValue(key, "VALUE" + std::to_string(i), "some text of a value", i + 1);
    }
    for (std::int64_t i = 0; here < count && i < 10; ++i) {
        fillBalanced(store, store.addKey(key, "KEY" + std::to_string(i)), (count - here) / 10);
    }
}

void fill(const Scratch& scratch, Shape shape, std::int64_t count) {
    BareStore store(scratch);
    store.run("BEGIN IMMEDIATE");
    const std::int64_t source = store.addKey(1, "SOURCE");
    if (shape == balanced) {
        fillBalanced(store, source, count);
    }
    for (std::int64_t i = 0; shape == wide && i < count; ++i) {
        store.addValue(store.addKey(source, "KEY" + std::to_string(i)), "VALUE", "some text of a value", 1);
    }
    for (std::int64_t i = 0; shape == flat && i < count; ++i) {
        store.addValue(source, "VALUE" + std::to_string(i), "some text of a value", i + 1);
    }
    store.run("COMMIT; PRAGMA wal_checkpoint(TRUNCATE)");
}

void arguments(benchmark::internal::Benchmark* bench) {
    for (const int shape : {balanced, wide, flat}) {
        for (const std::int64_t count : {1000, 10000, 100000, 1000000}) {
            bench->Args({shape, count});
        }
    }
    bench->ArgNames({"shape", "values"})->Iterations(1)->Unit(benchmark::kMillisecond);
}

void treeCopy(benchmark::State& state) {
    const Scratch scratch;
    fill(scratch, static_cast<Shape>(state.range(0)), state.range(1));
    EmbeddedRegistry registry = openStore(scratch);
    for (auto step : state) {
        require(TreeCopy(registry).copy(KeyHandle::localMachine, "SOURCE", KeyHandle::localMachine, "TARGET", true) ==
                kSuccess);
    }
    state.SetItemsProcessed(state.range(1));
}
BENCHMARK(treeCopy)->Apply(arguments);

void treeCopyBare(benchmark::State& state) {
    const Scratch scratch;
    fill(scratch, static_cast<Shape>(state.range(0)), state.range(1));
    BareStore store(scratch);
    store.run("BEGIN IMMEDIATE");
    for (auto step : state) {
        store.copy(store.find(1, "SOURCE"), store.addKey(1, "TARGET"));
    }
    state.SetItemsProcessed(state.range(1));
}
BENCHMARK(treeCopyBare)->Apply(arguments);

void treeDelete(benchmark::State& state) {
    const Scratch scratch;
    fill(scratch, static_cast<Shape>(state.range(0)), state.range(1));
    EmbeddedRegistry registry = openStore(scratch);
    for (auto step : state) {
        require(deleteTree(registry, KeyHandle::localMachine, "SOURCE", 0, {}, {}) == kSuccess);
    }
    state.SetItemsProcessed(state.range(1));
}
BENCHMARK(treeDelete)->Apply(arguments);

void treeDeleteBare(benchmark::State& state) {
    const Scratch scratch;
    fill(scratch, static_cast<Shape>(state.range(0)), state.range(1));
    BareStore store(scratch);
    store.run("BEGIN IMMEDIATE");
    for (auto step : state) {
        store.remove(store.find(1, "SOURCE"));
    }
    state.SetItemsProcessed(state.range(1));
}
BENCHMARK(treeDeleteBare)->Apply(arguments);

// Migrates a version-8 registry with such a tree below PROFILES to version 9 and back, without the providers.
void migrationThereAndBack(benchmark::State& state) {
    const Scratch scratch;
    fill(scratch, static_cast<Shape>(state.range(0)), state.range(1));
    EmbeddedRegistry registry = openStore(scratch);
    require(TreeCopy(registry).copy(KeyHandle::localMachine, "SOURCE", KeyHandle::localMachine,
                                    "SOFTWARE\\NVQ\\KZ7\\PROFILES", true) == kSuccess &&
            deleteTree(registry, KeyHandle::localMachine, "SOURCE", 0, {}, {}) == kSuccess &&
            registry.commit() == kSuccess);
    const std::unique_ptr<IFileSystem> files = embeddedFiles(scratch.path());
    ServiceRecords services(registry, *files);
    HeldConsole console;
    Report report(console);
    for (auto step : state) {
        migrateToVersion9(
            registry, services, report, [](std::string_view) { return std::string("9.1.0.0"); },
            [&](std::string_view) { return registry.commit(); }, "C:\\KZ9");
        require(restoreVersion8(registry, services, report, "C:\\KZ8") == kSuccess);
    }
    state.SetItemsProcessed(state.range(1));
}
BENCHMARK(migrationThereAndBack)->Apply(arguments);

// One step of an enumeration at the given index.
void enumerateAt(benchmark::State& state) {
    const Scratch scratch;
    fill(scratch, state.range(0) == 0 ? wide : flat, 100000 + 10000);
    EmbeddedRegistry registry = openStore(scratch);
    OwnedKey key(registry);
    FixedBuffer<260> name;
    require(registry.openKey(KeyHandle::localMachine, "SOURCE", kKeyRead, key.receive()) == kSuccess);
    const auto enumerate = [&](std::uint32_t index) {
        return state.range(0) == 0 ? registry.enumerateKey(key.get(), index, name, nullptr)
                                   : registry.enumerateValue(key.get(), index, name, nullptr, nullptr);
    };
    auto index = static_cast<std::uint32_t>(state.range(1));
    require(enumerate(index) == kSuccess);
    for (auto step : state) {
        require(enumerate(++index) == kSuccess);
    }
}
BENCHMARK(enumerateAt)->ArgNames({"values", "index"})->ArgsProduct({{0, 1}, {10, 100000}})->Iterations(9000);

// The writes of an add, in one transaction that is committed.
void addWrites(benchmark::State& state) {
    const Scratch scratch;
    EmbeddedRegistry registry = openStore(scratch);
    std::int64_t round = 0;
    for (auto step : state) {
        const std::string root = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\COPY" + std::to_string(++round);
        for (int key = 0; key < 9; ++key) {
            const std::string path = root + "\\KEY" + std::to_string(key);
            for (int value = 0; value < 5; ++value) {
                require(setText(registry, path, "VALUE" + std::to_string(value), "some text of a value") == kSuccess);
            }
        }
        require(registry.commit() == kSuccess);
    }
}
BENCHMARK(addWrites)->Iterations(2000)->Unit(benchmark::kMicrosecond);

void addWritesBare(benchmark::State& state) {
    const Scratch scratch;
    BareStore store(scratch);
    store.run("BEGIN IMMEDIATE");
    const std::int64_t root = store.addKey(1, "ROOT");
    store.run("COMMIT");
    std::int64_t round = 0;
    for (auto step : state) {
        store.run("BEGIN IMMEDIATE");
        const std::int64_t copy = store.addKey(root, "COPY" + std::to_string(++round));
        for (int key = 0; key < 9; ++key) {
            const std::int64_t id = store.addKey(copy, "KEY" + std::to_string(key));
            for (int value = 0; value < 5; ++value) {
                store.addValue(id, "VALUE" + std::to_string(value), "some text of a value", value + 1);
            }
        }
        store.run("COMMIT");
    }
}
BENCHMARK(addWritesBare)->Iterations(2000)->Unit(benchmark::kMicrosecond);

// Building the list of installed copies and finding the last one by name.
void copiesList(benchmark::State& state) {
    const Scratch scratch;
    EmbeddedRegistry registry = openStore(scratch);
    for (std::int64_t i = 0; i < state.range(0); ++i) {
        const std::string path = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\COPY" + std::to_string(i);
        require(setText(registry, path, "KZ7 Path Name", "C:\\KZ7") == kSuccess &&
                setText(registry, path + "\\Components", "BASE_CLIENT", "") == kSuccess);
    }
    const std::unique_ptr<IConsole> console = standardConsole();
    const std::unique_ptr<IDebugOutput> debug = hostDebugOutput(*console, nullptr);
    for (auto step : state) {
        InstallCopyList copies(registry, *debug, false, false);
        require(copies.count() == state.range(0) && copies.findByName("copy9") != nullptr);
        require(copies.findByName("none") == nullptr);
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK(copiesList)->Arg(100)->Arg(1000)->Arg(10000)->Unit(benchmark::kMillisecond);

}  // namespace
}  // namespace kz7
