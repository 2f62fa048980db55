#include <windows.h>

#include <string>

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
    std::string commandLine = std::string("\"") + program + "\" " + mode + " " + argument;
    STARTUPINFOA startup{};
    startup.cb = sizeof startup;
    startup.dwFlags = STARTF_USESTDHANDLES;
    startup.hStdOutput = GetStdHandle(STD_OUTPUT_HANDLE);
    startup.hStdError = GetStdHandle(STD_ERROR_HANDLE);
    PROCESS_INFORMATION started{};
    return CreateProcessA(nullptr, commandLine.data(), nullptr, nullptr, TRUE, 0, nullptr, nullptr, &startup,
                          &started) != FALSE;
}

}  // namespace kz7::test
