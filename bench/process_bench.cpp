// Running a program with its output captured, compared with the bare calls in pairs: the capture with one loop that
// reads a pipe and appends; start and end with posix_spawn() and two pipes that two threads read. KZ7_BENCH_LARGE=1
// adds the capture of 1 GiB. The ratio is that of the fastest tenth of each.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "install/platform/embedded/ports.h"
#include "install/runtime/install_process.h"

namespace kz7 {
namespace {

void require(bool held) {
    if (!held) {
        std::abort();
    }
}

std::string childProgram() {
    return std::filesystem::read_symlink("/proc/self/exe").parent_path() / "kz7_bench_child.exe";
}

std::string readBare(int descriptor) {
    std::string text;
    char piece[512];
    for (ssize_t count = read(descriptor, piece, sizeof piece); count > 0;
         count = read(descriptor, piece, sizeof piece)) {
        text.append(piece, static_cast<std::size_t>(count));
    }
    close(descriptor);
    return text;
}

// Starts the child on pipes for the first `streams` of standard output and error.
pid_t startBare(const std::string& argument, int streams, int (&readEnds)[2]) {
    const std::string program = childProgram();
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    int writeEnds[2];
    for (int i = 0; i < streams; ++i) {
        int ends[2];
        require(pipe2(ends, O_CLOEXEC) == 0);
        readEnds[i] = ends[0];
        writeEnds[i] = ends[1];
        posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO + i);
    }
    char* const argv[] = {const_cast<char*>(program.c_str()), const_cast<char*>(argument.c_str()), nullptr};
    pid_t id = 0;
    require(posix_spawn(&id, program.c_str(), &actions, nullptr, argv, environ) == 0);
    posix_spawn_file_actions_destroy(&actions);
    for (int i = 0; i < streams; ++i) {
        close(writeEnds[i]);
    }
    return id;
}

void captureBare(std::size_t mebibytes) {
    int readEnds[2];
    const pid_t child = startBare(std::to_string(mebibytes), 1, readEnds);
    const std::string text = readBare(readEnds[0]);
    require(waitpid(child, nullptr, 0) == child && text.size() == mebibytes << 20);
}

void startAndWaitBare() {
    int readEnds[2];
    const pid_t child = startBare("0", 2, readEnds);
    std::thread output([&] { readBare(readEnds[0]); });
    std::thread error([&] { readBare(readEnds[1]); });
    require(waitpid(child, nullptr, 0) == child);
    output.join();
    error.join();
}

void runOurs(std::size_t mebibytes) {
    const std::unique_ptr<IProcessHost> host = embeddedProcesses("/nonexistent");
    const std::unique_ptr<IThreads> threads = embeddedThreads();
    QuietSink sink;
    InstallProcess process(*host, *threads, sink, (childProgram() + " " + std::to_string(mebibytes)).c_str());
    std::uint32_t code = 1;
    require(process.execute(true, false) == kSuccess);
    require(process.waitForCompletion(code, kInfiniteWait) == kSuccess && code == 0);
}

// The limit of the fastest tenth, which other load affects least.
double fastest(std::vector<double>& seconds) {
    const auto at = seconds.begin() + static_cast<std::ptrdiff_t>(seconds.size() / 10);
    std::nth_element(seconds.begin(), at, seconds.end());
    return *at;
}

// Alternates, so that other load affects both.
void inPairs(benchmark::State& state, const std::function<void()>& ours, const std::function<void()>& bare) {
    const auto timed = [](const std::function<void()>& run) {
        const auto begin = std::chrono::steady_clock::now();
        run();
        return std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
    };
    std::vector<double> oursSeconds;
    std::vector<double> bareSeconds;
    for (auto step : state) {
        oursSeconds.push_back(timed(ours));
        bareSeconds.push_back(timed(bare));
        state.SetIterationTime(oursSeconds.back());
    }
    const double oursFastest = fastest(oursSeconds);
    const double bareFastest = fastest(bareSeconds);
    state.counters["ours_us"] = oursFastest * 1e6;
    state.counters["bare_us"] = bareFastest * 1e6;
    state.counters["time_ratio"] = oursFastest / bareFastest;
    state.counters["speed_ratio"] = bareFastest / oursFastest;
}

void capture(benchmark::State& state) {
    const auto mebibytes = static_cast<std::size_t>(state.range(0));
    // The output must not contain NUL bytes, which would end the text.
    inPairs(
        state, [=] { runOurs(mebibytes); }, [=] { captureBare(mebibytes); });
}

// By the mebibytes in use and the limit of open files: 0 for that of this session, which is also the maximum.
void startAndWait(benchmark::State& state) {
    const auto bytes = static_cast<std::size_t>(state.range(0)) << 20;
    const std::vector<char> inUse(bytes, 'x');
    benchmark::DoNotOptimize(inUse.data());
    rlimit before{};
    getrlimit(RLIMIT_NOFILE, &before);
    if (state.range(1) != 0) {
        const auto wanted = static_cast<rlim_t>(state.range(1));
        const rlimit raised{wanted, std::max(wanted, before.rlim_max)};
        const rlimit allowed{before.rlim_max, before.rlim_max};
        require(setrlimit(RLIMIT_NOFILE, &raised) == 0 || setrlimit(RLIMIT_NOFILE, &allowed) == 0);
    }
    rlimit used{};
    getrlimit(RLIMIT_NOFILE, &used);
    state.counters["open_files"] = static_cast<double>(used.rlim_cur);
    inPairs(
        state, [] { runOurs(0); }, startAndWaitBare);
    setrlimit(RLIMIT_NOFILE, &before);
}

BENCHMARK(startAndWait)
    ->Args({0, 0})
    ->Args({1024, 0})
    ->Args({0, 1'000'000})
    ->Args({1024, 1'000'000})
    ->Iterations(1500)
    ->UseManualTime()
    ->Unit(benchmark::kMicrosecond);
BENCHMARK(capture)->Arg(1)->Iterations(300)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(capture)->Arg(100)->Iterations(15)->UseManualTime()->Unit(benchmark::kMillisecond);

[[maybe_unused]] const bool large =
    std::getenv("KZ7_BENCH_LARGE") != nullptr && benchmark::RegisterBenchmark("capture", capture)
                                                         ->Arg(1024)
                                                         ->Iterations(5)
                                                         ->UseManualTime()
                                                         ->Unit(benchmark::kMillisecond) != nullptr;

}  // namespace
}  // namespace kz7
