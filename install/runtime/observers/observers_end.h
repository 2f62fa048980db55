// Destroys the process's observers, if they exist, at the end of a scope. Declare it after the engine.
#pragma once

#include "install/runtime/observers/human_stream.h"
#include "install/runtime/observers/log_observer.h"
#include "install/runtime/observers/machine_stream.h"

namespace kz7 {

struct ObserversEnd {
    ObserversEnd() = default;
    ObserversEnd(const ObserversEnd&) = delete;
    ObserversEnd& operator=(const ObserversEnd&) = delete;
    ~ObserversEnd() {
        // Before the log: the last line for a front end has its path.
        UREExternalObserverMachineStream::release();
        UREExternalObserverHumanStream::release();
        URELogObserver::release();
    }
};

}  // namespace kz7
