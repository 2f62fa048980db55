// What every process host and every kind of threads must do alike: this machine's and the ones in memory.
#include <gtest/gtest.h>

#include <filesystem>
#include <random>
#include <set>

#include "install/platform/memory/process_host.h"
#include "install/platform/memory/threads.h"
#include "tests/support/host_processes.h"

namespace kz7::test {
namespace {

std::string readAll(IProcessHost& host, StreamHandle stream, Status& ending) {
    std::string all;
    FixedBuffer<3> piece;
    for (ending = host.read(stream, piece); ending == kSuccess; ending = host.read(stream, piece)) {
        all += piece.view();
    }
    return all;
}

class ProcessHostContract : public testing::TestWithParam<const char*> {
protected:
    ProcessHostContract() {
        if (std::string_view(GetParam()) == "host") {
            host_ = hostProcesses();
        } else {
            auto memory = std::make_unique<MemoryProcessHost>();
            memory->addProgram(childProgram(), {.output = "spoken", .error = "cried", .exitCode = 5});
            host_ = std::move(memory);
        }
    }

    std::unique_ptr<IProcessHost> host_;
};

TEST_P(ProcessHostContract, PipesCarryBytesToTheirEndAndTellWhenTheOtherSideIsGone) {
    OwnedStream reading(*host_);
    OwnedStream writing(*host_);
    ASSERT_EQ(host_->createPipe(reading.receive(), writing.receive()), kSuccess);
    OwnedStream copy(*host_);
    ASSERT_EQ(host_->duplicate(reading.get(), copy.receive()), kSuccess);
    reading.reset();

    const std::string bytes("one\0two", 7);
    EXPECT_EQ(host_->write(writing.get(), bytes), kSuccess);
    writing.reset();
    Status ending = kSuccess;
    EXPECT_EQ(readAll(*host_, copy.get(), ending), bytes);
    EXPECT_EQ(ending, kBrokenPipe);

    ASSERT_EQ(host_->createPipe(reading.receive(), writing.receive()), kSuccess);
    reading.reset();
    EXPECT_EQ(host_->write(writing.get(), "lost"), kPipeClosing);
}

TEST_P(ProcessHostContract, HandlesThatAreNotOpenAreRefused) {
    FixedBuffer<8> piece;
    StreamHandle copy = StreamHandle::none;
    std::uint32_t code = 77;
    EXPECT_EQ(host_->read(StreamHandle::none, piece), kInvalidHandle);
    EXPECT_EQ(host_->write(StreamHandle::none, "x"), kInvalidHandle);
    EXPECT_EQ(host_->duplicate(StreamHandle::none, copy), kInvalidHandle);
    EXPECT_EQ(host_->closeStream(StreamHandle::none), kInvalidHandle);
    EXPECT_EQ(host_->waitProcess(ProcessHandle::none, kInfiniteWait), kInvalidHandle);
    EXPECT_EQ(host_->exitCode(ProcessHandle::none, code), kInvalidHandle);
    EXPECT_EQ(host_->closeProcess(ProcessHandle::none), kInvalidHandle);
    EXPECT_EQ(code, 77U);
}

TEST_P(ProcessHostContract, SlotsHoldWhateverTheyAreGiven) {
    for (const StandardSlot slot : {StandardSlot::output, StandardSlot::error}) {
        StreamHandle before = StreamHandle::none;
        StreamHandle held = StreamHandle::none;
        ASSERT_EQ(host_->getSlot(slot, before), kSuccess);
        StreamHandle reading = StreamHandle::none;
        StreamHandle writing = StreamHandle::none;
        ASSERT_EQ(host_->createPipe(reading, writing), kSuccess);
        EXPECT_EQ(host_->setSlot(slot, writing), kSuccess);
        EXPECT_EQ(host_->closeStream(reading), kSuccess);
        EXPECT_EQ(host_->closeStream(writing), kSuccess);
        EXPECT_EQ(host_->getSlot(slot, held), kSuccess);
        EXPECT_EQ(held, writing) << "also once what it names is closed";
        EXPECT_EQ(host_->setSlot(slot, before), kSuccess);
    }
}

TEST_P(ProcessHostContract, ProgramsWriteToTheirStreamsAndLeaveAnExitCode) {
    OwnedStream output(*host_);
    OwnedStream outputEnd(*host_);
    OwnedStream error(*host_);
    OwnedStream errorEnd(*host_);
    ASSERT_EQ(host_->createPipe(output.receive(), outputEnd.receive()), kSuccess);
    ASSERT_EQ(host_->createPipe(error.receive(), errorEnd.receive()), kSuccess);
    const std::string commandLine = "\"" + childProgram() + "\" print spoken cried 5";
    ProcessInformation child;
    ASSERT_EQ(host_->startProcess({commandLine, {}, outputEnd.get(), errorEnd.get()}, child), kSuccess);
    EXPECT_NE(child.processId, 0U);
    outputEnd.reset();
    errorEnd.reset();

    std::uint32_t code = 0;
    EXPECT_EQ(host_->waitProcess(child.process, kInfiniteWait), kSuccess);
    EXPECT_EQ(host_->waitProcess(child.process, 0), kSuccess) << "an end stays an end";
    EXPECT_EQ(host_->exitCode(child.process, code), kSuccess);
    EXPECT_EQ(code, 5U);
    Status ending = kSuccess;
    EXPECT_EQ(readAll(*host_, output.get(), ending), "spoken");
    EXPECT_EQ(readAll(*host_, error.get(), ending), "cried");
    EXPECT_EQ(ending, kBrokenPipe);
    EXPECT_EQ(host_->closeProcess(child.process), kSuccess);
    if (child.mainThread != ProcessHandle::none) {
        EXPECT_EQ(host_->closeProcess(child.mainThread), kSuccess);
    }
}

TEST_P(ProcessHostContract, ProgramsThatAreNotThereDoNotStart) {
    // clang-format off
    const struct { const char* commandLine; const char* why; } rows[] = {
        {"\"/no such/program.exe\" x", "no such file"},
        {"folder\\program.exe x",      "nothing is started from the current folder"},
        {"kz7-no-such-program",        "nowhere on the search path"},
    };
    // clang-format on
    for (const auto& row : rows) {
        ProcessInformation child;
        const Status status = host_->startProcess({row.commandLine, {}, StreamHandle::none, StreamHandle::none}, child);
        EXPECT_TRUE(status == kFileNotFound || status == kPathNotFound) << row.why << ": " << status;
        EXPECT_EQ(child.process, ProcessHandle::none) << row.why;
    }
    ProcessInformation child;
    const ProcessStart blank{"  ", {}, StreamHandle::none, StreamHandle::none};
    EXPECT_NE(host_->startProcess(blank, child), kSuccess);
}

TEST_P(ProcessHostContract, BareNamesAreNotTakenFromTheCurrentFolder) {
    namespace fs = std::filesystem;
    const fs::path before = fs::current_path();
    const fs::path folder = fs::temp_directory_path() / ("kz7-stray-" + std::to_string(std::random_device()()));
    fs::create_directory(folder);
    fs::copy_file(childProgram(), folder / "kz7_stray.exe");
    fs::current_path(folder);
    for (const char* commandLine : {"kz7_stray.exe", "kz7_stray", "\"kz7_stray.exe\" input"}) {
        ProcessInformation child;
        EXPECT_EQ(host_->startProcess({commandLine, {}, StreamHandle::none, StreamHandle::none}, child), kFileNotFound)
            << commandLine;
    }
    fs::current_path(before);
    fs::remove_all(folder);
}

INSTANTIATE_TEST_SUITE_P(Hosts, ProcessHostContract, testing::Values("host", "memory"));

class ThreadsContract : public testing::TestWithParam<const char*> {
protected:
    ThreadsContract() {
        if (std::string_view(GetParam()) == "host") {
            threads_ = hostThreads();
        } else {
            threads_ = std::make_unique<MemoryThreads>();
        }
    }

    std::unique_ptr<IThreads> threads_;
};

TEST_P(ThreadsContract, ThreadsCallTheirFunctionAndAreWaitedForAnyNumberOfTimes) {
    int values[3] = {};
    std::set<std::uint32_t> ids;
    ThreadHandle threads[3] = {};
    for (int i = 0; i < 3; ++i) {
        const auto count = [](void* value) { ++*static_cast<int*>(value); };
        auto record = std::make_unique<ThreadStart>(ThreadStart{count, &values[i]});
        std::uint32_t id = 0;
        const std::uint32_t stack = i == 0 ? 0 : 256 * 1024 + 1;
        ASSERT_EQ(threads_->start(record, stack, id, threads[i]), kSuccess);
        EXPECT_EQ(record, nullptr);
        ids.insert(id);
    }
    EXPECT_EQ(ids.size(), 3U);
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ(threads_->wait(threads[i]), kSuccess);
        EXPECT_EQ(threads_->wait(threads[i]), kSuccess);
        EXPECT_EQ(values[i], 1);
        EXPECT_EQ(threads_->close(threads[i]), kSuccess);
    }
    EXPECT_EQ(threads_->wait(ThreadHandle::none), kInvalidHandle);
    EXPECT_EQ(threads_->close(ThreadHandle::none), kInvalidHandle);
}

INSTANTIATE_TEST_SUITE_P(Kinds, ThreadsContract, testing::Values("host", "memory"));

}  // namespace
}  // namespace kz7::test
