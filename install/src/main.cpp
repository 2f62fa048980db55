#include <cstdio>
#include <new>

#include "install/platform/text.h"
#include "install/src/uselvlkz7reg.h"

int main(int argc, char** argv) {
    try {
        const auto platform = kz7::hostPlatform({.program = "kz7InstallReg"});
        const kz7::Status status = kz7::runTool(*platform, {argv, static_cast<std::size_t>(argc)});
        // The exit code stays that of the flow. A reader that is gone, as in "| head -1", chose to miss the rest.
        const kz7::Status written = platform->console().flush();
        if (!kz7::succeeded(written) && written != kz7::kPipeClosing) {
            platform->console().writeError(
                kz7::compose("kz7InstallReg: cannot write standard output: error %u\n", {written}));
        }
        return kz7::hostExitCode(status);
    } catch (const std::bad_alloc&) {
        // What was not committed is dropped with the platform.
        std::fputs("kz7InstallReg: out of memory\n", stderr);
        return kz7::hostExitCode(kz7::kOutOfMemory);
    }
}
