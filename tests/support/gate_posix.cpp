#include <fcntl.h>
#include <spawn.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <random>

#include "tests/support/gate.h"

namespace kz7::test {

Gate::Gate() : name_(std::filesystem::temp_directory_path() / ("kz7-gate-" + std::to_string(std::random_device()()))) {
    if (mkfifo(name_.c_str(), 0600) != 0) {
        std::abort();
    }
}

Gate::~Gate() {
    unlink(name_.c_str());
}

void Gate::open() {
    close(::open(name_.c_str(), O_WRONLY | O_CLOEXEC));
}

void waitAtGate(const char* name) {
    char byte = 0;
    const int gate = open(name, O_RDONLY);
    while (read(gate, &byte, 1) > 0) {
    }
    close(gate);
}

bool startInheriting(const char* program, const char* mode, const char* argument) {
    char* const argv[] = {const_cast<char*>(program), const_cast<char*>(mode), const_cast<char*>(argument), nullptr};
    pid_t id = 0;
    return posix_spawn(&id, "/proc/self/exe", nullptr, nullptr, argv, environ) == 0;
}

}  // namespace kz7::test
