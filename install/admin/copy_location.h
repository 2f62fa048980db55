// Where a copy is installed.
#pragma once

#include <string>

#include "install/platform/registry_store.h"

namespace kz7 {

// The location that a copy's key holds, that key given by its path; empty where it cannot be read.
std::string locationOf(IRegistryStore& registry, const std::string& copyPath);

}  // namespace kz7
