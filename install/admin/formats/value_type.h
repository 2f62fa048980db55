// Typed values as text: their names and numbers, and their data for people and for programs.
#pragma once

#include <string>
#include <string_view>

#include "install/admin/formats/json_text.h"
#include "install/platform/registry_store.h"

namespace kz7 {

// "REG_SZ" and so on; "type 99" for a type without a name.
std::string typeName(ValueType type);

// The number in a dword of 4 bytes or a qword of 8 bytes; false for all other data.
bool numberOf(ValueType type, std::string_view data, std::uint64_t& number);

// The data for people, with a blank before each part.
std::string shownData(ValueType type, std::string_view data);

// The fields of a JSON object that hold the data: "type", "bytes", and "text" or "number" where it is one.
void appendData(ValueType type, std::string_view data, JsonWriter& json);

}  // namespace kz7
