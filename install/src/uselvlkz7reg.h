// The tool's entry: picks the one flow that the command line asks for.
#pragma once

#include <span>
#include <vector>

#include "install/platform/platform.h"
#include "install/src/registry/report.h"

namespace kz7 {

// Runs a command; `arguments` begins with the program's name. Returns the flow's status, which is the exit
// code; kInvalidParameter after the usage text.
// With `errors`, the error lines are kept there, too.
Status runTool(const Ports& ports, std::span<const char* const> arguments, std::vector<ErrorLine>* errors = nullptr);

// Whether the arguments are one of the options and do not bring out the usage text.
bool isToolCommand(std::span<const char* const> arguments);

}  // namespace kz7
