#include <cstdio>
#include <new>

#include "install/src/uselvlkz7reg.h"

int main(int argc, char** argv) {
    try {
        const auto platform = kz7::hostPlatform({.program = "kz7InstallReg"});
        return kz7::hostExitCode(kz7::runTool(*platform, {argv, static_cast<std::size_t>(argc)}));
    } catch (const std::bad_alloc&) {
        // What was not committed is dropped with the platform.
        std::fputs("kz7InstallReg: out of memory\n", stderr);
        return kz7::hostExitCode(kz7::kOutOfMemory);
    }
}
