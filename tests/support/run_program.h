// Runs a built program as a user does and returns its result.
#pragma once

#include <sys/types.h>

#include <functional>
#include <ostream>
#include <string>
#include <vector>

#include "tests/support/temporary_directory.h"

namespace kz7::test {

struct ProgramResult {
    int exitCode = 0;  // or, below 0, the signal that ended it
    std::string output;
    std::string error;

    bool operator==(const ProgramResult&) const = default;
    friend std::ostream& operator<<(std::ostream& stream, const ProgramResult& result) {
        return stream << result.exitCode << '|' << result.output << '|' << result.error;
    }
};

struct ProgramOptions {
    std::vector<std::string> environment;  // added to the parent's, NAME=value
    std::function<void()> inChild;         // after the fork, for limits
};

// A file's bytes; empty without a file.
std::string contents(const std::string& path);
// Creates a file or replaces its bytes.
void overwrite(const std::string& path, const std::string& bytes);

// The path of one of the project's programs.
std::string programPath(const std::string& name);

// Starts without waiting. Standard input is empty.
pid_t startProgram(const std::vector<std::string>& command, const ProgramOptions& options = {},
                   const std::string& output = "/dev/null", const std::string& error = "/dev/null");
ProgramResult runProgram(const std::vector<std::string>& command, const ProgramOptions& options = {});

// For `inChild`: no file may grow beyond that size.
std::function<void()> limitFileSize(std::size_t bytes);

}  // namespace kz7::test
