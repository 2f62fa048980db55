// The end of the process's observers, whichever of them there are: with the object, which goes before the engine that
// they observe.
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
        // The last line of a front end names the log.
        UREExternalObserverMachineStream::release();
        UREExternalObserverHumanStream::release();
        URELogObserver::release();
    }
};

}  // namespace kz7
