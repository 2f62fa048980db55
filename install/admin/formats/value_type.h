// Names and numbers of typed values.
#pragma once

#include <string_view>

#include "install/platform/registry_store.h"

namespace kz7 {

// "REG_SZ" and so on; empty for an unknown type.
std::string_view typeName(ValueType type);

// The number in a dword of 4 bytes or a qword of 8 bytes; false for all other data.
bool numberOf(ValueType type, std::string_view data, std::uint64_t& number);

}  // namespace kz7
