// A point where a child program waits until its test continues it, so that the order of events is certain without a
// sleep; and two helpers of the child.
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

    // Lets one program pass. Waits until the program has arrived, if the system can tell.
    void open();

private:
    std::string name_;
    [[maybe_unused]] void* event_ = nullptr;  // where the system can tell
};

// For the child.
void waitAtGate(const char* name);
bool startInheriting(const char* program, const char* mode, const char* argument);

}  // namespace kz7::test
