#include "tests/support/run_program.h"

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>

namespace kz7::test {
namespace {

pid_t start(const std::vector<std::string>& command, const ProgramOptions& options, int output, int error) {
    std::vector<char*> arguments;
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
        const int nothing = open("/dev/null", O_RDWR);
        dup2(nothing, 0);
        dup2(output < 0 ? nothing : output, 1);
        dup2(error < 0 ? nothing : error, 2);
        closefrom(3);
        if (options.inChild) {
            options.inChild();
        }
        execv(arguments[0], arguments.data());
        _exit(127);
    }
    return child;
}

}  // namespace

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

ProgramResult runProgram(const std::vector<std::string>& command, const ProgramOptions& options) {
    // Files, not pipes: nothing of a flood can block, and a program that outlives its parent holds nobody up.
    const TemporaryDirectory scratch;
    const std::string outputPath = scratch.path() + "/output";
    const std::string errorPath = scratch.path() + "/error";
    const int output = open(outputPath.c_str(), O_CREAT | O_WRONLY | O_CLOEXEC, 0600);
    const int error = open(errorPath.c_str(), O_CREAT | O_WRONLY | O_CLOEXEC, 0600);
    const pid_t child = start(command, options, output, error);
    close(output);
    close(error);
    int status = 0;
    waitpid(child, &status, 0);
    return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, WIFSIGNALED(status) ? WTERMSIG(status) : 0,
            contents(outputPath), contents(errorPath)};
}

pid_t startProgram(const std::vector<std::string>& command, const ProgramOptions& options) {
    return start(command, options, -1, -1);
}

}  // namespace kz7::test
