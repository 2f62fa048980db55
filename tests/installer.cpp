// An installer program for tests and trials: a run of the installer runtime on this machine's ports.
//   kz7_installer LOG machine|human EXITCODE [MILLISECONDS between its steps]
// Answered ABORT, it undoes what it did and ends with 1.
#include <array>
#include <chrono>
#include <cstdlib>
#include <string>
#include <thread>

#include "install/platform/platform.h"
#include "install/runtime/observers/human_stream.h"
#include "install/runtime/observers/log_observer.h"
#include "install/runtime/observers/machine_stream.h"
#include "install/runtime/runtime_ports.h"

namespace kz7::test {
namespace {

void step(int milliseconds) {
    std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
}

int install(URE& engine, int pause, int exitCode) {
    engine.announceTasks("10,30;11,50;20,20");
    engine.startTask(0, 10, true, "Copying files");
    step(pause);
    engine.trace(kTraceError, "Installer::copy", 10, kSuccess, "42 files");
    engine.endTask(10, true, "Copying files");
    std::string answer;
    const auto response = engine.ask(1, kMediumNeededMessage, {}, "D:\\", answer);
    engine.startTask(30, 11, true, "Registering the copy");
    step(pause);
    if (response == UREInfo::Response::aborted) {
        engine.error(kCodeError, "Installer::install", 10, kMissingItem);
        engine.startTask(0, kUndoTask, true, "undo");
        step(pause);
        engine.endTask(kUndoTask, true, "undo");
        return 1;
    }
    engine.endTask(11, true, "Registering the copy");
    engine.startTask(80, 20, false, "Creating the instance");
    step(pause);
    if (exitCode != 0) {
        engine.error(kCodeError, "Installer::configure", 20, kNotExecuted);
    }
    engine.endTask(20, false, "Creating the instance");
    return exitCode;
}

}  // namespace
}  // namespace kz7::test

int main(int argc, char** argv) {
    using namespace kz7;
    if (argc < 4) {
        return 2;
    }
    const auto platform = hostPlatform({.program = "kz7_installer"});
    URE engine(portsOf(*platform));
    engine.mode = kModeInstall;
    URELogObserver* log = URELogObserver::getInstance(engine);
    log->setLogFile(argv[1]);
    engine.registerObserver(*log, Takes::everything);
    UREExternalObserverStream* stream = nullptr;
    if (std::string(argv[2]) == "machine") {
        stream = UREExternalObserverMachineStream::getInstance(engine);
    } else {
        stream = UREExternalObserverHumanStream::getInstance(engine);
    }
    engine.registerObserver(*stream);
    const int exitCode = test::install(engine, argc > 4 ? std::atoi(argv[4]) : 0, std::atoi(argv[3]));
    engine.unregisterObserver(*stream);
    log->writeHeader(true);
    UREExternalObserverMachineStream::release();
    UREExternalObserverHumanStream::release();
    URELogObserver::release();
    return exitCode;
}
