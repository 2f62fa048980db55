#include <process.h>
#include <windows.h>

#include "tests/support/gate.h"

namespace kz7::test {

Gate::Gate() {
    static int count = 0;
    name_ = "kz7-gate-" + std::to_string(GetCurrentProcessId()) + "-" + std::to_string(++count);
    event_ = CreateEventA(nullptr, FALSE, FALSE, name_.c_str());
}

Gate::~Gate() {
    CloseHandle(event_);
}

void Gate::open() {
    SetEvent(event_);
}

void waitAtGate(const char* name) {
    HANDLE event = OpenEventA(SYNCHRONIZE, FALSE, name);
    WaitForSingleObject(event, INFINITE);
    CloseHandle(event);
}

bool startInheriting(const char* program, const char* mode, const char* argument) {
    return _spawnl(_P_NOWAIT, program, program, mode, argument, nullptr) != -1;
}

}  // namespace kz7::test
