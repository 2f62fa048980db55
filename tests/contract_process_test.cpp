// The contract of the process port, for this machine's and the one in memory.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>

#include "tests/support/backends.h"
#include "tests/support/temporary_directory.h"

namespace kz7::test {
namespace {

class ProcessHostContract : public Contract {
protected:
    IProcessHost* host_ = &platform_.processes();
    FixedBuffer<3> piece_;
};

INSTANTIATE_TEST_SUITE_P(Hosts, ProcessHostContract, testing::ValuesIn(kBackends));

TEST_P(ProcessHostContract, PipesCarryAllBytesAndReportAClosedEnd) {
    OwnedStream reading(*host_);
    OwnedStream writing(*host_);
    OwnedStream copy(*host_);
    ASSERT_EQ(host_->createPipe(reading.receive(), writing.receive()), kSuccess);
    ASSERT_EQ(host_->duplicate(reading.get(), copy.receive()), kSuccess);
    reading.reset();
    const std::string bytes("one\0two", 7);
    EXPECT_EQ(host_->write(writing.get(), bytes), kSuccess);
    writing.reset();
    std::string all;
    Status ending = kSuccess;
    while ((ending = host_->read(copy.get(), piece_)) == kSuccess) {
        all += piece_.view();
    }
    EXPECT_EQ(all, bytes);
    EXPECT_EQ(ending, kBrokenPipe);

    ASSERT_EQ(host_->createPipe(reading.receive(), writing.receive()), kSuccess);
    reading.reset();
    EXPECT_EQ(host_->write(writing.get(), "lost"), kPipeClosing);
}

TEST_P(ProcessHostContract, HandlesThatAreNotOpenAreRefused) {
    std::uint32_t code = 77;
    OwnedStream copy(*host_);
    EXPECT_EQ(host_->read(StreamHandle::none, piece_), kInvalidHandle);
    EXPECT_EQ(host_->write(StreamHandle::none, "x"), kInvalidHandle);
    EXPECT_EQ(host_->duplicate(StreamHandle::none, copy.receive()), kInvalidHandle);
    EXPECT_EQ(host_->closeStream(StreamHandle::none), kInvalidHandle);
    EXPECT_EQ(host_->waitProcess(ProcessHandle::none, kInfiniteWait), kInvalidHandle);
    EXPECT_EQ(host_->exitCode(ProcessHandle::none, code), kInvalidHandle);
    EXPECT_EQ(host_->closeProcess(ProcessHandle::none), kInvalidHandle);
    EXPECT_EQ(code, 77U);
}

TEST_P(ProcessHostContract, MissingProgramsDoNotStart) {
    namespace fs = std::filesystem;
    const TemporaryDirectory directory;
    const fs::path folder = directory.path();
    const fs::path before = fs::current_path();
    const std::string searchPath = std::getenv("PATH");
    fs::create_directory(folder / "bare folder");
    fs::copy_file(childProgram(), folder / "kz7_stray.exe");
    fs::copy_file(childProgram(), folder / "bare folder/kz7_stray.exe");
    fs::current_path(folder);
    setSearchPath(".");  // relative, like the programs
    // clang-format off
    const struct { std::string commandLine; bool pathMayBeNamed; const char* why; } rows[] = {
        {"\"/no such/program.exe\" x",                              true,  "no such file"},
        {"..\\" + folder.filename().string() + "\\kz7_stray.exe x", true,  "nothing is started from the current folder"},
        {"bare folder\\kz7_stray.exe x", true, "the same behind a bare name that is nowhere"},
        {"kz7-no-such-program",                                     true,  "nowhere on the search path"},
        {"kz7_stray.exe",                                           false, "a bare name in the current folder"},
        {"kz7_stray",                                               false, "the same without its ending"},
        {"\"kz7_stray.exe\" input",                                 false, "the same in quotes"},
    };
    // clang-format on
    for (const auto& row : rows) {
        ProcessInformation child;
        const Status status = host_->startProcess({row.commandLine, {}, StreamHandle::none, StreamHandle::none}, child);
        EXPECT_TRUE(status == kFileNotFound || (row.pathMayBeNamed && status == kPathNotFound))
            << row.why << ": " << status;
        EXPECT_EQ(child.process, ProcessHandle::none) << row.why;
    }
    ProcessInformation child;
    const std::string program = childProgram();
    const ProcessStart elsewhere{program, "bare folder", StreamHandle::none, StreamHandle::none};
    EXPECT_NE(host_->startProcess(elsewhere, child), kSuccess) << "a working directory that hangs on the current one";
    setSearchPath(searchPath);
    fs::current_path(before);
}

}  // namespace
}  // namespace kz7::test
