// An installer program, for a front end to drive: announces its tasks, tells of each, asks where its medium is, keeps a
// log, setup.log, in the folder of the programs' own. Answered ABORT, it undoes what it did and ends with 1; else it
// ends with the exit code that it is given, or 0.
#include <cstdlib>
#include <string>

#include "install/platform/platform.h"
#include "install/runtime/observers/observers_end.h"
#include "install/runtime/runtime_ports.h"

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

}  // namespace
}  // namespace kz7

int main(int argc, char** argv) {
    using namespace kz7;
    const auto platform = hostPlatform({.program = "kz7_installer"});
    URE engine(portsOf(*platform));
    engine.mode = kModeInstall;
    const ObserversEnd end;
    URELogObserver* log = URELogObserver::getInstance(engine);
    std::string folder;
    if (platform->ownFolder(folder) == kSuccess) {
        log->setLogFile(folder + "\\setup.log");
    }
    engine.registerObserver(*log, Takes::everything);
    engine.registerObserver(*UREExternalObserverMachineStream::getInstance(engine));
    const int exitCode = install(engine, argc > 1 ? std::atoi(argv[1]) : 0);
    log->writeHeader(true);
    return exitCode;
}
