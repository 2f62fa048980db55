// Whole stores as registry-editor text and back, with the functions of kz7admin.
#pragma once

#include <string>
#include <string_view>

#include "install/platform/registry_store.h"

namespace kz7::test {

// The export of a whole store.
std::string exportAll(IRegistryStore& registry);

// Parses and applies a file. Returns an empty text, or "line: reason" or "line: error n".
std::string importText(IRegistryStore& registry, std::string_view file);

}  // namespace kz7::test
