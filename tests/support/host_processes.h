// This machine's process and thread ports, and the program that the tests start with them.
#pragma once

#include <filesystem>
#include <memory>
#include <string>

#include "install/platform/process_host.h"
#include "install/platform/threads.h"

namespace kz7::test {

std::unique_ptr<IProcessHost> hostProcesses();
std::unique_ptr<IThreads> hostThreads();

// The path of the test's child program, in the host's form.
std::string childProgram();

// The level library of the sample copy, which is built beside the programs.
inline std::filesystem::path sampleLibrary() {
    return std::filesystem::path(childProgram()).parent_path().parent_path() / "examples/copy/bin/kz7install64.dll";
}

// How much a child writes on each stream in a flood: a pipe is slow where the host is emulated.
extern const std::size_t kFloodMebibytes;

}  // namespace kz7::test
