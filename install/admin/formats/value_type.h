// The names that people know the types of values by.
#pragma once

#include <string_view>

#include "install/platform/registry_store.h"

namespace kz7 {

// Empty for a number without a name.
std::string_view typeName(ValueType type);

// The number that the bytes of a 4-byte dword or an 8-byte qword stand for; false for all others.
bool numberOf(ValueType type, std::string_view data, std::uint64_t& number);

}  // namespace kz7
