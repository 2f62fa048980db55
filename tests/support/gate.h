// A place where a started program waits until its test lets it go on: what makes the order of events certain
// without any sleep. Also the few things that a test's child does by the system's calls.
#pragma once

#include <string>

namespace kz7::test {

class Gate {
public:
    Gate();
    ~Gate();
    Gate(const Gate&) = delete;
    Gate& operator=(const Gate&) = delete;

    const std::string& name() const { return name_; }

    // Lets one program pass; waits until it is there, where the system can tell.
    void open();

private:
    std::string name_;
    [[maybe_unused]] void* event_ = nullptr;  // where the system can tell
};

// In the child.
void waitAtGate(const char* name);
bool startInheriting(const char* program, const char* mode, const char* argument);

}  // namespace kz7::test
