// Flushed lines of the runtime compared with spdlog's, flushed for each line: a log line with its time, an info in the
// log, a protocol line, and the allocations of an info to all three observers. Standard output goes to a file.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <spdlog/logger.h>
#include <spdlog/sinks/basic_file_sink.h>
#include <spdlog/sinks/stdout_sinks.h>
#include <unistd.h>

#include <algorithm>
#include <string>

#include "bench/scratch.h"
#include "install/platform/platform.h"
#include "install/runtime/observers/human_stream.h"
#include "install/runtime/observers/log_observer.h"
#include "install/runtime/observers/machine_stream.h"
#include "install/runtime/runtime_ports.h"

namespace kz7::bench {

static std::uint64_t allocations = 0;

}  // namespace kz7::bench

// Not inlined: otherwise gcc reports the pair as a mismatch.
[[gnu::noinline]] void* operator new(std::size_t size) {
    ++kz7::bench::allocations;
    void* const memory = std::malloc(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}

[[gnu::noinline]] void operator delete(void* memory) noexcept {
    std::free(memory);
}

[[gnu::noinline]] void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}

namespace kz7 {
namespace {

// The product path of a file in the folder.
std::string productPath(const Scratch& scratch, const std::string& name) {
    std::string path = scratch.file(name);
    std::replace(path.begin(), path.end(), '/', '\\');
    return path;
}

class OutputToFile {
public:
    explicit OutputToFile(const std::string& file) : kept_(dup(1)) {
        std::fflush(stdout);
        const int descriptor = open(file.c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
        dup2(descriptor, 1);
        close(descriptor);
    }
    ~OutputToFile() {
        std::fflush(stdout);
        dup2(kept_, 1);
        close(kept_);
    }
    OutputToFile(const OutputToFile&) = delete;
    OutputToFile& operator=(const OutputToFile&) = delete;

private:
    int kept_;
};

constexpr const char* kText = "Copying a file with a name of a usual length";

// The engine with its log open.
class Run {
public:
    explicit Run(const Scratch& scratch)
        : platform_(hostPlatform({.program = "bench", .stateDirectory = scratch.file("state")})),
          engine(portsOf(*platform_)),
          log(*URELogObserver::getInstance(engine)) {
        log.setLogFile(productPath(scratch, "kz7msi.log"));
        engine.registerObserver(log, Takes::everything);
    }
    ~Run() { URELogObserver::release(); }
    Run(const Run&) = delete;
    Run& operator=(const Run&) = delete;

private:
    std::unique_ptr<IPlatform> platform_;

public:
    URE engine;
    URELogObserver& log;
};

void logLineWithTime(benchmark::State& state) {
    const Scratch scratch;
    Run run(scratch);
    for ([[maybe_unused]] auto each : state) {
        run.log.writeFunction(kText);
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(logLineWithTime);

void logInfo(benchmark::State& state) {
    const Scratch scratch;
    Run run(scratch);
    for ([[maybe_unused]] auto each : state) {
        run.engine.trace(kTraceError, "Copier::copy", 10, kSuccess, kText);
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(logInfo);

void spdlogLineWithTime(benchmark::State& state) {
    const Scratch scratch;
    spdlog::logger logger("log", std::make_shared<spdlog::sinks::basic_file_sink_st>(scratch.file("spdlog.log")));
    logger.set_pattern("%H:%M:%S%v");
    logger.flush_on(spdlog::level::info);
    for ([[maybe_unused]] auto each : state) {
        logger.info("{}, step {}: {}", "writeFunction", 10, kText);
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(spdlogLineWithTime);

void protocolLine(benchmark::State& state) {
    const Scratch scratch;
    Run run(scratch);
    run.engine.unregisterObserver(run.log);
    const OutputToFile output(scratch.file("output"));
    auto* stream = UREExternalObserverMachineStream::getInstance(run.engine);
    run.engine.registerObserver(*stream);
    for ([[maybe_unused]] auto each : state) {
        run.engine.startTask(40, 10, true, kText);
    }
    state.SetItemsProcessed(state.iterations());
    run.engine.unregisterObserver(*stream);
    UREExternalObserverMachineStream::release();
}
BENCHMARK(protocolLine);

void infoToThreeObservers(benchmark::State& state) {
    const Scratch scratch;
    Run run(scratch);
    const OutputToFile output(scratch.file("output"));
    auto* machine = UREExternalObserverMachineStream::getInstance(run.engine);
    auto* human = UREExternalObserverHumanStream::getInstance(run.engine);
    run.engine.registerObserver(*machine);
    run.engine.registerObserver(*human);
    run.engine.error(kCodeError, "Copier::copy", 10, kNotExecuted);
    const std::uint64_t before = bench::allocations;
    for ([[maybe_unused]] auto each : state) {
        run.engine.error(kCodeError, "Copier::copy", 10, kNotExecuted);
    }
    state.counters["allocations"] = static_cast<double>(bench::allocations - before);
    run.engine.unregisterObserver(*human);
    run.engine.unregisterObserver(*machine);
    UREExternalObserverHumanStream::release();
    UREExternalObserverMachineStream::release();
}
BENCHMARK(infoToThreeObservers);

void spdlogStandardOutput(benchmark::State& state) {
    const Scratch scratch;
    const OutputToFile output(scratch.file("output"));
    spdlog::logger logger("output", std::make_shared<spdlog::sinks::stdout_sink_st>());
    logger.set_pattern("%v");
    logger.flush_on(spdlog::level::info);
    for ([[maybe_unused]] auto each : state) {
        logger.info("PROGRESS TASK START :: INSTALLATION :: {} :: {} :: {}", 40, 10, kText);
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(spdlogStandardOutput);

}  // namespace
}  // namespace kz7
