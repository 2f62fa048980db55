// An installer program for tests: a run of the installer runtime on this machine's ports.
//   kz7_installer EXITCODE
// Its log is C:\setup.log. Answered ABORT, it undoes what it did and ends with 1.
#include <cstdlib>
#include <string>

#include "install/platform/platform.h"
#include "install/runtime/observers/observers_end.h"
#include "install/runtime/runtime_ports.h"

namespace kz7::test {
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
}  // namespace kz7::test

int main(int, char** argv) {
    using namespace kz7;
    const auto platform = hostPlatform({.program = "kz7_installer"});
    URE engine(portsOf(*platform));
    engine.mode = kModeInstall;
    const ObserversEnd end;
    URELogObserver* log = URELogObserver::getInstance(engine);
    log->setLogFile("C:\\setup.log");
    engine.registerObserver(*log, Takes::everything);
    engine.registerObserver(*UREExternalObserverMachineStream::getInstance(engine));
    const int exitCode = test::install(engine, std::atoi(argv[1]));
    log->writeHeader(true);
    return exitCode;
}
