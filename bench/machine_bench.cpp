// What judges a machine of many copies, compared with reading the same keys through the port.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <memory>
#include <string>

#include "bench/scratch.h"
#include "install/admin/formats/html_report.h"
#include "install/platform/embedded/ports.h"
#include "install/platform/embedded/registry.h"
#include "install/platform/memory/small_ports.h"
#include "install/platform/service_records.h"
#include "install/src/add_copy.h"
#include "install/src/registry/key_walk.h"
#include "install/src/remove_copy.h"

namespace kz7 {
namespace {

void require(bool held) {
    if (!held) {
        std::abort();
    }
}

// A store with that many copies, their services and their aliases.
class Copies {
public:
    explicit Copies(std::int64_t count) : files_(embeddedFiles(scratch_.path())) {
        Report report(console_);
        for (std::int64_t copy = 0; copy < count; ++copy) {
            const std::string name = nameOf(copy);
            require(addCopy(registry_, services_, report, {}, {name, "C:\\KZ7\\" + name}) == kSuccess);
        }
        console_ = {};
        MemoryDebugOutput debug;
        require(InstallCopiesProfile(registry_, debug).run() == kSuccess && registry_.commit() == kSuccess);
    }

    static std::string nameOf(std::int64_t copy) { return "COPY" + std::to_string(copy); }

    MachineState read(Depth depth) {
        MachineState machine;
        std::string key;
        require(readMachine(registry_, depth, machine, key) == kSuccess);
        return machine;
    }

    Scratch scratch_;
    MemoryConsole console_;
    std::unique_ptr<IFileSystem> files_;
    EmbeddedRegistry registry_{scratch_.path(), false, [](const StoreFault&) { std::abort(); }};
    ServiceRecords services_{registry_, *files_};
};

// Keeps the last store: the library calls a benchmark again for each estimate of its length.
Copies& copiesOf(std::int64_t count) {
    static std::unique_ptr<Copies> kept;
    static std::int64_t size = 0;
    if (kept == nullptr || size != count) {
        kept.reset();
        kept = std::make_unique<Copies>(count);
        size = count;
    }
    return *kept;
}

// Opens a key, reads all values and goes on below it, up to a depth.
void readKey(IRegistryStore& registry, KeyHandle parent, const std::string& path, int depth) {
    OwnedKey key(registry);
    require(registry.openKey(parent, path, kKeyRead, key.receive()) == kSuccess);
    TextBuffer<260> name;
    TextBuffer<10000> data;
    ValueType type{};
    for (std::uint32_t value = 0; registry.enumerateValue(key.get(), value, name, &type, &data) == kSuccess; ++value) {
        benchmark::DoNotOptimize(data.size);
    }
    for (std::uint32_t below = 0; depth > 0 && registry.enumerateKey(key.get(), below, name, nullptr) == kSuccess;
         ++below) {
        const std::string subkey(name.text());
        if (depth != 1 || path.find("InstalledCopies") != std::string::npos || subkey == "CurrentVersion") {
            readKey(registry, key.get(), subkey, depth - 1);
        }
    }
}

void readWhole(benchmark::State& state) {
    Copies& copies = copiesOf(state.range(0));
    for (auto _ : state) {
        std::vector<KeyStart> starts;
        require(findEverything(copies.registry_, false, starts) == kSuccess);
        for (const KeyStart& start : starts) {
            readKey(copies.registry_, start.name.root, start.name.path, 9);
        }
        copies.registry_.commit();
    }
}

void check(benchmark::State& state) {
    Copies& copies = copiesOf(state.range(0));
    for (auto _ : state) {
        require(findFindings(copies.read(Depth::whole), *copies.files_, false).empty());
        copies.registry_.commit();
    }
}

void examine(benchmark::State& state) {
    Copies& copies = copiesOf(state.range(0));
    for (auto _ : state) {
        std::vector<std::string> damages;
        require(copies.registry_.examine(damages) == kSuccess && damages.empty());
        copies.registry_.commit();
    }
}

void report(benchmark::State& state) {
    Copies& copies = copiesOf(state.range(0));
    for (auto _ : state) {
        const MachineState machine = copies.read(Depth::whole);
        benchmark::DoNotOptimize(htmlReport({"store",
                                             "host",
                                             "time",
                                             machine,
                                             copyLines(machine, copies.services_, {}, false),
                                             findFindings(machine, *copies.files_, true),
                                             {}})
                                     .size());
        copies.registry_.commit();
    }
}

// The keys of the copies and of their versions in both views.
void readVersions(benchmark::State& state) {
    Copies& copies = copiesOf(state.range(0));
    for (auto _ : state) {
        for (const ViewRow& view : kViews) {
            readKey(copies.registry_, KeyHandle::localMachine, std::string(view.copies), 2);
        }
        copies.registry_.commit();
    }
}

void resolve(benchmark::State& state) {
    Copies& copies = copiesOf(state.range(0));
    for (auto _ : state) {
        require(!candidatesOf(copies.read(Depth::copies), "9.7").empty());
        copies.registry_.commit();
    }
}

// The same and the services.
void readVersionsAndServices(benchmark::State& state) {
    Copies& copies = copiesOf(state.range(0));
    for (auto _ : state) {
        for (const ViewRow& view : kViews) {
            readKey(copies.registry_, KeyHandle::localMachine, std::string(view.copies), 2);
        }
        for (std::int64_t copy = 0; copy < state.range(0); ++copy) {
            readKey(copies.registry_, KeyHandle::localMachine,
                    "SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC_" + Copies::nameOf(copy), 0);
        }
        copies.registry_.commit();
    }
}

void copies(benchmark::State& state) {
    Copies& all = copiesOf(state.range(0));
    for (auto _ : state) {
        const MachineState machine = all.read(Depth::copies);
        benchmark::DoNotOptimize(copiesText(copyLines(machine, all.services_, {}, false), {}, 0).size());
        all.registry_.commit();
    }
}

// What the list of copies reads of each.
void readList(benchmark::State& state) {
    Copies& all = copiesOf(state.range(0));
    for (auto _ : state) {
        OwnedKey key(all.registry_);
        require(all.registry_.openKey(KeyHandle::localMachine, layout::kCopies, kKeyRead, key.receive()) == kSuccess);
        TextBuffer<260> name;
        for (std::uint32_t at = 0; all.registry_.enumerateKey(key.get(), at, name, nullptr) == kSuccess; ++at) {
            const std::string copy(name.text());
            readKey(all.registry_, key.get(), copy, 0);
            readKey(all.registry_, key.get(), copy + "\\Components", 0);
        }
        all.registry_.commit();
    }
}

// The copy is added again outside the measured time.
void removal(benchmark::State& state) {
    Copies& all = copiesOf(state.range(0));
    MemoryConsole console;
    MemoryDebugOutput debug;
    Report lines(console);
    for (auto _ : state) {
        require(removeCopy(all.registry_, all.services_, debug, lines, "COPY7") == kSuccess);
        state.PauseTiming();
        require(addCopy(all.registry_, all.services_, lines, {}, {"COPY7", "C:\\KZ7\\COPY7"}) == kSuccess);
        all.registry_.commit();
        state.ResumeTiming();
    }
}

void size(benchmark::internal::Benchmark* benchmark) {
    benchmark->Arg(10000)->Unit(benchmark::kMillisecond)->MinTime(1);
}
BENCHMARK(readWhole)->Apply(size);
BENCHMARK(check)->Apply(size);
BENCHMARK(examine)->Apply(size);
BENCHMARK(report)->Apply(size);
BENCHMARK(readVersions)->Apply(size);
BENCHMARK(resolve)->Apply(size);
BENCHMARK(readVersionsAndServices)->Apply(size);
BENCHMARK(copies)->Apply(size);
BENCHMARK(readList)->Apply(size);
BENCHMARK(removal)->Apply(size);

}  // namespace
}  // namespace kz7
