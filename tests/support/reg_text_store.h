// Whole stores as registry-editor text and back, as the commands of kz7admin do it.
#pragma once

#include <string>
#include <string_view>

#include "install/platform/registry_store.h"

namespace kz7::test {

// The export of everything in a store.
std::string exportAll(IRegistryStore& registry);

// Parses a file and does what it asks for; empty, or "line: reason" or "line: error n".
std::string importText(IRegistryStore& registry, std::string_view file);

}  // namespace kz7::test
