// Where a copy is installed, and from where its service runs.
#pragma once

#include <string>

#include "install/src/registry/key_reader.h"

namespace kz7 {

// The location in the copy's key of that path; empty if it cannot be read.
std::string locationOf(IRegistryStore& registry, const std::string& copyPath);

// What a service starts; kFileNotFound: there is no such service.
Status readServiceProgram(IRegistryStore& registry, std::string_view service, ValueState& program);

}  // namespace kz7
