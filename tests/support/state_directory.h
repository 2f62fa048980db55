// A state directory of the embedded platform as a test sees it from outside.
#pragma once

#include <string>
#include <vector>

#include "tests/support/run_program.h"

namespace kz7::test {

class StateDirectory {
public:
    const std::string& path() const { return directory_.path(); }
    std::string file(const std::string& name) const { return path() + "/" + name; }

    // Runs a program of the project on this store.
    ProgramResult run(const std::string& program, std::vector<std::string> arguments,
                      ProgramOptions options = {}) const;
    ProgramResult tool(std::vector<std::string> arguments, ProgramOptions options = {}) const;
    // Starts the tool without waiting; output and errors are dropped.
    pid_t start(std::vector<std::string> arguments) const;

    // Everything in the store; a store that is not there reads as empty. A fault of the store is told in the text.
    std::string dump() const;

    // "ok", or what SQLite's own check finds.
    std::string integrity() const;

    void copyFrom(const StateDirectory& other) const;

private:
    TemporaryDirectory directory_;
};

}  // namespace kz7::test
