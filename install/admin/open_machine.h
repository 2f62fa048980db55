// Reads the machine of a command for the commands that only look at it.
#pragma once

#include "install/admin/admin.h"
#include "install/admin/machine.h"

namespace kz7 {

Answer openMachine(Admin& admin, Depth depth, MachineState& machine);

// All of it, with the damages of its store and the runs that did not end.
Answer openWholeMachine(Admin& admin, MachineState& machine);

}  // namespace kz7
