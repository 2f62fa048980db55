// The installer runtime on a machine in memory, with or without an installer session.
#pragma once

#include <string>

#include "install/platform/memory/installer_session.h"
#include "install/platform/memory/platform.h"
#include "install/runtime/observers/human_stream.h"
#include "install/runtime/observers/log_observer.h"
#include "install/runtime/observers/machine_stream.h"
#include "install/runtime/runtime_ports.h"
#include "install/runtime/ure.h"

namespace kz7::test {

// The process-wide observers of a test go with it.
class RuntimeMachine : public MemoryPlatform {
public:
    explicit RuntimeMachine(bool withSession = false) : engine(portsOf(*this, withSession ? &session : nullptr)) {
        processes_.addProgram(kFolder, {});  // has a short form
        files_.add(std::string(kFolder) + "readme");
    }
    ~RuntimeMachine() override {
        UREExternalObserverMachineStream::release();
        UREExternalObserverHumanStream::release();
        URELogObserver::release();
    }
    RuntimeMachine(const RuntimeMachine&) = delete;
    RuntimeMachine& operator=(const RuntimeMachine&) = delete;

    URELogObserver& log() { return *URELogObserver::getInstance(engine); }

    // Opens the log and registers it.
    void openLog() {
        log().setLogFile(kLogFile);
        engine.registerObserver(log(), Takes::everything);
    }
    std::string logText() { return files_.content(kLogFile); }

    static constexpr const char* kFolder = "C:\\Setup Logs\\";
    static constexpr const char* kLogFile = "C:\\Setup Logs\\setup.log";

    MemoryInstallerSession session;
    URE engine;
};

}  // namespace kz7::test
