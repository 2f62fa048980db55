// Where a copy is installed.
#pragma once

#include <string>

#include "install/platform/registry_store.h"

namespace kz7 {

// The location in the copy's key of that path; empty if it cannot be read.
std::string locationOf(IRegistryStore& registry, const std::string& copyPath);

}  // namespace kz7
