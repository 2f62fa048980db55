// Runs the rest of its command line, quotation marks and all, and then writes a line of its own with the
// whole exit code: a shell sees only the low 8 bits.
#include <windows.h>

#include <cstdio>

namespace {

// Behind the first argument: a program's own name ends at its quotation mark or at a blank.
char* restOf(char* commandLine) {
    char* at = commandLine;
    const bool quoted = *at == '"';
    do {
        ++at;
    } while (*at != '\0' && *at != (quoted ? '"' : ' '));
    at += quoted && *at != '\0' ? 1 : 0;
    while (*at == ' ') {
        ++at;
    }
    return at;
}

}  // namespace

int main() {
    STARTUPINFOA startup{};
    startup.cb = sizeof startup;
    PROCESS_INFORMATION started{};
    if (!CreateProcessA(nullptr, restOf(GetCommandLineA()), nullptr, nullptr, TRUE, 0, nullptr, nullptr, &startup,
                        &started)) {
        std::fprintf(stderr, "full_exit_code: cannot start the program: error %lu\n", GetLastError());
        return 1;
    }
    DWORD code = 0;
    if (WaitForSingleObject(started.hProcess, INFINITE) != WAIT_OBJECT_0 ||
        !GetExitCodeProcess(started.hProcess, &code)) {
        std::fprintf(stderr, "full_exit_code: cannot wait: error %lu\n", GetLastError());
        return 1;
    }
    CloseHandle(started.hThread);
    CloseHandle(started.hProcess);
    std::printf("\nexit code %lu\n", code);
    return 0;
}
