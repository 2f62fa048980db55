// The entry of the tool: selects the flow that the command line asks for.
#pragma once

#include <span>

#include "install/platform/platform.h"

namespace kz7 {

// Runs a command; `arguments` begins with the program's name. Returns the status of the flow, which is the exit code,
// or kInvalidParameter after the usage text.
Status runTool(IPlatform& platform, std::span<const char* const> arguments);

}  // namespace kz7
