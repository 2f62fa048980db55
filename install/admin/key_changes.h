// What an import does, as a list that is made whole before the first of it is done.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "install/admin/key_name.h"

namespace kz7 {

struct ValueChange {
    std::uint32_t line = 0;  // of the file that asks for it
    std::string name;
    bool remove = false;
    ValueType type = ValueType::none;
    std::string data;
};

// Makes a key with its missing parents and changes its values in order, or deletes it with all below it.
struct KeyChange {
    std::uint32_t line = 0;
    KeyName name;
    std::string keyClass;  // given to a key that is made
    bool remove = false;
    std::vector<ValueChange> values;
};

// Does all of it without a commit; what is to be deleted and is not there is no failure. On a failure `line`
// is the one that asked for what failed, and what came before it is done.
Status applyChanges(IRegistryStore& registry, const std::vector<KeyChange>& changes, std::uint32_t& line);

}  // namespace kz7
