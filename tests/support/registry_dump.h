// A registry as text, so that whole states can be compared and differences are easy to read.
#pragma once

#include <string>

#include "install/platform/registry_store.h"

namespace kz7::test {

// Everything below a key: a line for each key ("[path] class") and value ("path : name = type:data", other bytes than
// printable ASCII as \xNN), in the order of the store.
std::string dumpRegistry(IRegistryStore& registry, KeyHandle root = KeyHandle::localMachine,
                         const std::string& path = {});

}  // namespace kz7::test
