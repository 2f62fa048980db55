// The entry of the tool: selects the flow that the command line asks for.
#pragma once

#include <span>
#include <string_view>
#include <vector>

#include "install/platform/platform.h"
#include "install/src/registry/report.h"

namespace kz7 {

// Runs a command; `arguments` begins with the program's name. Returns the status of the flow, which is the exit code,
// or kInvalidParameter after the usage text. With `errors`, also
// keeps the error lines there.
Status runTool(const Ports& ports, std::span<const char* const> arguments, std::vector<ErrorLine>* errors = nullptr);

// The words of the options.
std::vector<std::string_view> toolOptions();

// Whether the arguments are one of the options and do not bring out the usage text.
bool isToolCommand(std::span<const char* const> arguments);

// Whether they start other programs.
bool startsPrograms(std::span<const char* const> arguments);

}  // namespace kz7
