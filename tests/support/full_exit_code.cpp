// Runs the rest of its command line, with its quotation marks, and then prints the whole exit code: a shell sees only
// the low 8 bits.
#include <windows.h>
// Needs the types above.
#include <shlwapi.h>

#include <cstdio>

int main() {
    STARTUPINFOW startup{};
    startup.cb = sizeof startup;
    PROCESS_INFORMATION started{};
    DWORD code = 0;
    if (!CreateProcessW(nullptr, PathGetArgsW(GetCommandLineW()), nullptr, nullptr, TRUE, 0, nullptr, nullptr, &startup,
                        &started) ||
        WaitForSingleObject(started.hProcess, INFINITE) != WAIT_OBJECT_0 ||
        !GetExitCodeProcess(started.hProcess, &code)) {
        std::fprintf(stderr, "full_exit_code: cannot run the program: error %lu\n", GetLastError());
        return 1;
    }
    CloseHandle(started.hThread);
    CloseHandle(started.hProcess);
    std::printf("\nexit code %lu\n", code);
    return 0;
}
