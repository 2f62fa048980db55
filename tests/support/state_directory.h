// A state directory of the embedded platform, used through the programs.
#pragma once

#include <string>
#include <vector>

#include "tests/support/run_program.h"

namespace kz7::test {

using Arguments = std::vector<std::string>;

inline const Arguments kAddFirst = {"-addKZ7Copy", "FIRST", "C:\\KZ7\\first"};
inline const Arguments kAddSecond = {"-addKZ7Copy", "SECOND", "C:\\KZ7\\second"};

class StateDirectory {
public:
    const std::string& path() const { return directory_.path(); }
    std::string file(const std::string& name) const { return path() + "/" + name; }

    // Runs a program of the project on this store, by default the tool, or kz7admin for arguments that begin with a
    // command of it.
    ProgramResult run(const std::string& program, Arguments arguments, ProgramOptions options = {}) const;
    ProgramResult tool(Arguments arguments, ProgramOptions options = {}) const {
        const char* const program = programOf(arguments);
        return run(program, std::move(arguments), std::move(options));
    }
    // Runs a shell command that begins with the name of a program of the project.
    ProgramResult shell(const std::string& command, ProgramOptions options = {}) const {
        options.environment.push_back("KZ7_STATE_DIR=" + path());
        return runProgram({"/bin/bash", "-c", programPath(command)}, options);
    }
    // Starts the same without waiting; output and errors are dropped.
    pid_t start(Arguments arguments) const;

    // The content of the store of a folder, or of this one; a missing store reads as empty. The text contains the
    // faults of the store.
    static std::string dumpOf(const std::string& folder);
    std::string dump() const { return dumpOf(path()); }

    // The same with the runs of its history.
    static std::string wholeOf(const std::string& folder);

    // The result of SQLite's integrity check.
    std::string integrity() const;

    void copyFrom(const StateDirectory& other) const;

private:
    static const char* programOf(const Arguments& arguments) {
        return arguments.front().starts_with('-') ? "kz7InstallReg" : "kz7admin";
    }

    TemporaryDirectory directory_;
};

}  // namespace kz7::test
