#include <cstdio>
#include <new>

#include "install/platform/program.h"
#include "install/platform/text.h"
#include "install/src/registry/change_recorder.h"
#include "install/src/uselvlkz7reg.h"

int kz7::programMain(int argc, char** argv) {
    try {
        const auto platform = hostPlatform({.program = "kz7InstallReg"});
        const std::span<const char* const> arguments(argv, static_cast<std::size_t>(argc));
        Status status = kSuccess;
        if (IHistory* const history = platform->history(); history != nullptr && history->isOn()) {
            history->begin({.program = "kz7InstallReg",
                            .arguments = {arguments.begin() + (argc == 0 ? 0 : 1), arguments.end()},
                            .startsPrograms = startsPrograms(arguments)});
            status =
                runTool(RecordedPorts(platform->ports(), {.wholeServices = platform->storeIsOwn()}).ports(), arguments);
            history->end(status);
        } else {
            status = runTool(platform->ports(), arguments);
        }
        // The exit code remains that of the flow. A reader that has gone, as in "| head -1", does not need the rest.
        const Status written = platform->console().flush();
        if (!succeeded(written) && written != kPipeClosing) {
            platform->console().writeError(
                compose("kz7InstallReg: cannot write standard output: error %u\n", {written}));
        }
        return hostExitCode(status);
    } catch (const std::bad_alloc&) {
        // Changes that are not committed are dropped with the platform.
        std::fputs("kz7InstallReg: out of memory\n", stderr);
        return hostExitCode(kOutOfMemory);
    }
}
