// Where a copy is installed, and from where its service runs.
#pragma once

#include <string>

#include "install/src/registry/key_reader.h"

namespace kz7 {

// The location in the copy's key of that path; empty if it cannot be read.
std::string locationOf(IRegistryStore& registry, const std::string& copyPath);

// Whether a service that starts `program` is the one of a copy at that location. Quotation marks, which administrators
// add against programs with the first part of a name with blanks, do not count.
bool isProgramOf(std::string_view location, std::string_view program);

// What a service starts; kFileNotFound: there is no such service.
Status readServiceProgram(IRegistryStore& registry, std::string_view service, ValueState& program);

}  // namespace kz7
