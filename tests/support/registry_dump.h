// A registry as text, so that two states compare whole and a difference reads at a glance.
#pragma once

#include <string>

#include "install/platform/registry_store.h"

namespace kz7::test {

// Everything below a key, a line for each key ("[path] class") and value ("path : name = type:data", bytes that
// are no printable ASCII as \xNN), in the order that the store gives them.
std::string dumpRegistry(IRegistryStore& registry, KeyHandle root = KeyHandle::localMachine,
                         const std::string& path = {});

}  // namespace kz7::test
