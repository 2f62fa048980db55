// Reads the machine of a command for the commands that only look at it.
#pragma once

#include "install/admin/admin.h"
#include "install/admin/machine.h"

namespace kz7 {

inline Answer openMachine(Admin& admin, Depth depth, MachineState& machine) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    std::string key;
    const Status status = readMachine(admin.registry(), depth, machine, key);
    if (status != kSuccess || admin.platform().storeFaultTold()) {
        return admin.storeFault("cannot read: " + shownText(key), status);
    }
    return kAnswerYes;
}

}  // namespace kz7
