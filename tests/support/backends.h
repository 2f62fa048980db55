// The implementations of the ports that every contract suite runs on: the one in memory and this machine's. Each is
// new, or works in a temporary folder of its own.
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <thread>

#include "install/platform/platform.h"

namespace kz7::test {

// Known differences of an implementation. In everything else it must behave like the others.
struct Differences {
    bool ordersValuesByName = false;     // instead of in insertion order
    bool ordersKeysByLowerCase = false;  // "_" before the letters
    bool foldsBeyondAscii = false;       // names that differ in the case of other letters are one
    bool passesClassesOn = false;        // to new parents, and to an existing key
    bool startsDeletedServices = false;  // while they are still open
    bool needsFramework = false;         // to keep data providers
    bool usesHandlesAgain = false;       // a closed handle may be that of another file
};

class Backend {
public:
    virtual ~Backend() = default;

    virtual IPlatform& platform() = 0;
    virtual Differences differences() const { return {}; }

    // The product path of an existing folder, of a program in it that can run as a service, and of the sample copy's
    // level library in it.
    virtual std::string folder() = 0;
    std::string program() { return folder() + "\\Program.exe"; }
    std::string library() { return folder() + "\\kz7install64.dll"; }

    // Creates a file that is named like a data provider in the folder's bin folder. No framework accepts it.
    virtual void addProvider() = 0;

    // Runs `body` with that text as standard input.
    virtual void reading(const std::string& input, const std::function<void()>& body) = 0;

    // The text that `writing` writes on standard output and standard error, in the order in which it arrives.
    virtual std::string written(const std::function<void(IConsole&)>& writing) = 0;
};

inline constexpr const char* kBackends[] = {"memory", "host"};

std::unique_ptr<Backend> backendNamed(const std::string& name);

// This machine's ports, and the folder that they use.
struct HostPorts {
    std::unique_ptr<IPlatform> platform;
    std::string folder;
    std::filesystem::path hostFolder;
    std::filesystem::path service;  // a program that runs as one
    Differences differences = {};
};

// `place` is a folder of the host that only this object uses.
HostPorts hostPorts(const std::string& place);

// The path of the child program, in the host's form, and the size of its output on each stream in a flood: pipes of an
// emulated host are slow.
std::string childProgram();
extern const std::size_t kFloodMebibytes;

// Whether a process of this host exits with a whole status, or with its low 8 bits.
extern const bool kExitCodesAreWhole;

void setSearchPath(const std::string& path);

// For states that a system shows only after a moment: the end of a thread, a child or a service.
inline bool eventually(const std::function<bool()>& holds) {
    bool held = holds();
    for (int i = 0; i < 1'000'000 && !held; ++i) {
        std::this_thread::yield();
        held = holds();
    }
    return held;
}

// The base of every contract suite: one of the implementations.
class Contract : public testing::TestWithParam<const char*> {
protected:
    std::unique_ptr<Backend> backend_ = backendNamed(GetParam());
    IPlatform& platform_ = backend_->platform();
};

}  // namespace kz7::test
