// The implementations of the ports that every contract suite runs over: the one in memory, and this machine's.
// Each is fresh, or open on a place of its own that goes with it.
#pragma once

#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <string_view>

#include "install/platform/platform.h"

namespace kz7::test {

// What an implementation is known to do differently. Everything else it must do like the others.
struct Differences {
    bool ordersValuesByName = false;     // instead of by when they were first set
    bool ordersKeysByLowerCase = false;  // "_" before the letters
    bool foldsBeyondAscii = false;       // names that differ in the case of other letters are one
    bool passesClassesOn = false;        // to new parents, and to the key when it is there already
    bool startsDeletedServices = false;  // while they are still open
    bool needsFramework = false;         // to keep data providers
    bool usesHandlesAgain = false;       // a closed handle may be that of another file
};

class Backend {
public:
    virtual ~Backend() = default;

    virtual IPlatform& platform() = 0;
    virtual Differences differences() const { return {}; }

    // The product's path of a folder that is there, and of a program in it that can run as a service.
    virtual std::string folder() = 0;
    virtual std::string program() = 0;

    // The sample copy's level library in that folder.
    std::string library() { return folder() + "\\kz7install64.dll"; }

    // Puts a data provider, which is none that a framework would take, into the bin folder below that folder.
    virtual void addProvider() = 0;

    // Does it while standard input is that text.
    virtual void reading(const std::string& input, const std::function<void()>& body) = 0;

    // What `writing` brings out on standard output, or on both streams in the order in which it arrives.
    virtual std::string written(bool both, const std::function<void(IConsole&)>& writing) = 0;
};

std::unique_ptr<Backend> hostBackend();

// The path of the program that the tests start, in the host's form, and how much it writes on each stream in a flood:
// a pipe is slow where the host is emulated.
std::string childProgram();
extern const std::size_t kFloodMebibytes;

// The level library of the sample copy, which is built beside the programs.
inline std::filesystem::path sampleLibrary() {
    return std::filesystem::path(childProgram()).parent_path().parent_path() / "examples/copy/bin/kz7install64.dll";
}

// The name is one of kBackends.
std::unique_ptr<Backend> backendNamed(std::string_view name);

inline constexpr const char* kBackends[] = {"memory", "host"};

}  // namespace kz7::test
