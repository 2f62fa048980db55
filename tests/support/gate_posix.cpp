#include <fcntl.h>
#include <spawn.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <filesystem>

#include "tests/support/gate.h"

namespace kz7::test {

Gate::Gate() {
    std::string folder = std::filesystem::temp_directory_path() / "kz7-gate-XXXXXX";
    if (mkdtemp(folder.data()) == nullptr) {
        std::abort();
    }
    name_ = folder + "/gate";
    if (mkfifo(name_.c_str(), 0600) != 0) {
        std::abort();
    }
}

Gate::~Gate() {
    std::filesystem::remove_all(std::filesystem::path(name_).parent_path());
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

void closeStandardStreams() {
    close(STDOUT_FILENO);
    close(STDERR_FILENO);
}

bool startInheriting(const char* program, const char* mode, const char* argument) {
    char* const argv[] = {const_cast<char*>(program), const_cast<char*>(mode), const_cast<char*>(argument), nullptr};
    pid_t id = 0;
    return posix_spawn(&id, "/proc/self/exe", nullptr, nullptr, argv, environ) == 0;
}

void endBySignal(int signal) {
    raise(signal);
}

std::string inheritedState() {
    std::string state;
    for (int descriptor = 0; descriptor < 1024; ++descriptor) {
        std::error_code error;
        const auto target = std::filesystem::read_symlink("/proc/self/fd/" + std::to_string(descriptor), error);
        if (!error) {
            state += std::to_string(descriptor) + " " + target.string().substr(0, target.string().find(':')) + "\n";
        }
    }
    sigset_t blocked;
    sigprocmask(SIG_BLOCK, nullptr, &blocked);
    for (int signal = 1; signal <= SIGRTMAX; ++signal) {
        struct sigaction action {};
        if (sigaction(signal, nullptr, &action) == 0 && action.sa_handler != SIG_DFL) {
            state += "signal " + std::to_string(signal) + " is not at its default\n";
        }
        if (sigismember(&blocked, signal) == 1) {
            state += "signal " + std::to_string(signal) + " is blocked\n";
        }
    }
    return state;
}

}  // namespace kz7::test
