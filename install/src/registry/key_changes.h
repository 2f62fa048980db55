// The changes that an import makes. The list is complete before the first change is applied.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "install/src/registry/key_name.h"

namespace kz7 {

struct ValueChange {
    std::uint32_t line = 0;  // in the imported file
    std::string name;
    bool remove = false;
    ValueType type = ValueType::none;
    std::string data;
};

// Creates a key with its missing parents and changes its values in order, or deletes it with its subkeys.
struct KeyChange {
    std::uint32_t line = 0;
    KeyName name;
    std::string keyClass;  // of a key that is created
    bool remove = false;
    std::vector<ValueChange> values;
};

// Applies the changes without a commit; succeeds if an item to delete does not exist. On failure `line` is the line of
// the change that failed; those before it are applied.
Status applyChanges(IRegistryStore& registry, const std::vector<KeyChange>& changes, std::uint32_t& line);

}  // namespace kz7
