// An installer program for a front end: announces its tasks, reports their progress, asks for its medium and writes a
// log, setup.log, to the state directory. On the answer ABORT it undoes its work and exits with 1; otherwise it exits
// with its argument or 0. 14: memory ran out.
#include <cstdlib>
#include <new>
#include <string>

#include "kz7/platform/platform.h"
#include "kz7/runtime/observers/observers_end.h"
#include "kz7/runtime/runtime_ports.h"

namespace kz7 {
namespace {

int install(URE& engine, int exitCode) {
    engine.announceTasks("10,30;11,50;20,20");
    engine.startTask(0, 10, true, "Copying files");
    engine.trace(kTraceError, "Installer::copy", 10, kSuccess, "42 files");
    engine.endTask(10, true, "Copying files");
    std::string answer;
    const auto response = engine.ask(1, kMediumNeededMessage, {}, "D:\\", answer);
    engine.startTask(30, 11, true, "Registering the copy");
    if (response == UREInfo::Response::aborted) {
        engine.error(kCodeError, "Installer::install", 10, kMissingItem);
        engine.startTask(0, kUndoTask, true, "undo");
        engine.endTask(kUndoTask, true, "undo");
        return 1;
    }
    engine.endTask(11, true, "Registering the copy");
    engine.startTask(80, 20, false, "Creating the instance");
    if (exitCode != 0) {
        engine.error(kCodeError, "Installer::configure", 20, kNotExecuted);
    }
    engine.endTask(20, false, "Creating the instance");
    return exitCode;
}

// Throws std::bad_alloc if memory runs out before the installation begins.
int runInstaller(int exitCode) {
    const auto platform = hostPlatform({.program = "kz7_installer"});
    URE engine(portsOf(*platform));
    engine.mode = kModeInstall;
    const ObserversEnd end;
    URELogObserver* log = URELogObserver::getInstance(engine);
    UREExternalObserverMachineStream* stream = UREExternalObserverMachineStream::getInstance(engine);
    std::string folder;
    if (log != nullptr && platform->ownFolder(folder) == kSuccess) {
        log->setLogFile(folder + "\\setup.log");
    }
    if (log == nullptr || stream == nullptr || engine.registerObserver(*log, Takes::everything) != kSuccess ||
        engine.registerObserver(*stream) != kSuccess) {
        throw std::bad_alloc();
    }
    const int result = install(engine, exitCode);
    log->writeHeader(true);
    return result;
}

}  // namespace
}  // namespace kz7

int main(int argc, char** argv) {
    try {
        return kz7::runInstaller(argc > 1 ? std::atoi(argv[1]) : 0);
    } catch (const std::bad_alloc&) {
        return kz7::hostExitCode(kz7::kOutOfMemory);
    }
}
