// Many installer properties saved and read back, and long response files; both must take linear time.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "bench/scratch.h"
#include "install/platform/memory/installer_session.h"
#include "install/platform/platform.h"
#include "install/runtime/config_handler.h"
#include "install/runtime/installer_properties.h"
#include "install/runtime/runtime_ports.h"

namespace kz7 {
namespace {

void sizes(benchmark::internal::Benchmark* bench) {
    bench->Arg(1000)->Arg(10000)->Arg(100000)->Unit(benchmark::kMillisecond)->Complexity(benchmark::oN);
}

void savedProperties(benchmark::State& state) {
    const Scratch scratch;
    const auto platform = hostPlatform({.program = "bench", .stateDirectory = scratch.path()});
    MemoryInstallerSession session;
    URE engine(portsOf(*platform, &session));
    const Installation at{session, platform->registry(), engine};
    for (int number = 0; number < state.range(0); ++number) {
        session.tableRows.push_back("PROPERTY_" + std::to_string(number));
        session.properties[session.tableRows.back()] = "value " + std::to_string(number);
    }
    for ([[maybe_unused]] auto each : state) {
        session.isScheduled = false;
        iSavePropertiesForDeferred(at);
        platform->registry().commit();
        session.isScheduled = true;
        char value[kPropertySize];
        for (const std::string& name : session.tableRows) {
            std::uint32_t size = sizeof value;
            if (iMsiGetProperty(at, name.c_str(), value, &size) != kSuccess || size <= 1) {
                std::abort();
            }
        }
        iDeleteSavedProperties(at);
        platform->registry().commit();
    }
    state.SetComplexityN(state.range(0));
}
BENCHMARK(savedProperties)->Apply(sizes);

void responseFile(benchmark::State& state) {
    const Scratch scratch;
    const auto platform = hostPlatform({.program = "bench", .stateDirectory = scratch.path()});
    URE engine(portsOf(*platform));
    ProfileRegistry profile(platform->registry(), "COPY1");
    std::string file;
    for (int number = 0; number < state.range(0); ++number) {
        file += "NAME_" + std::to_string(number) + " = \"a value\"\n";
    }
    for ([[maybe_unused]] auto each : state) {
        std::vector<ResponseKeyword> keywords;
        ResponseFault fault;
        KZ7CfgHandler handler(engine, profile, {});
        if (parseResponseFile(file, keywords, fault) != kSuccess) {
            std::abort();
        }
        for (const ResponseKeyword& keyword : keywords) {
            benchmark::DoNotOptimize(handler.recordVariable(keyword.name, keyword.value));
            benchmark::DoNotOptimize(handler.recordParameter(keyword.name, keyword.value));
        }
    }
    state.SetComplexityN(state.range(0));
}
BENCHMARK(responseFile)->Apply(sizes);

}  // namespace
}  // namespace kz7
