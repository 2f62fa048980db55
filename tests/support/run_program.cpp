#include "tests/support/run_program.h"

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>

namespace kz7::test {

std::string contents(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void overwrite(const std::string& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary | std::ios::trunc) << bytes;
}

std::string programPath(const std::string& name) {
    return std::string(KZ7_PROGRAMS) + "/" + name;
}

pid_t startProgram(const std::vector<std::string>& command, const ProgramOptions& options, const std::string& output,
                   const std::string& error) {
    std::vector<char*> arguments;
    arguments.reserve(command.size() + 1);
    for (const std::string& argument : command) {
        arguments.push_back(const_cast<char*>(argument.c_str()));
    }
    arguments.push_back(nullptr);
    std::fflush(nullptr);
    const pid_t child = fork();
    if (child == 0) {
        for (const std::string& variable : options.environment) {
            putenv(const_cast<char*>(variable.c_str()));
        }
        dup2(open("/dev/null", O_RDONLY), 0);
        dup2(open(output.c_str(), O_CREAT | O_WRONLY, 0600), 1);
        dup2(open(error.c_str(), O_CREAT | O_WRONLY, 0600), 2);
        closefrom(3);
        if (options.inChild) {
            options.inChild();
        }
        execv(arguments[0], arguments.data());
        _exit(127);
    }
    return child;
}

ProgramResult runProgram(const std::vector<std::string>& command, const ProgramOptions& options) {
    // Files instead of pipes: large output cannot block, and a program that outlives its parent delays nothing.
    const TemporaryDirectory scratch;
    const std::string output = scratch.path() + "/output";
    const std::string error = scratch.path() + "/error";
    int status = 0;
    waitpid(startProgram(command, options, output, error), &status, 0);
    return {WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status), contents(output), contents(error)};
}

std::function<void()> limitFileSize(std::size_t bytes) {
    return [limit = rlimit{bytes, bytes}] { setrlimit(RLIMIT_FSIZE, &limit); };
}

}  // namespace kz7::test
