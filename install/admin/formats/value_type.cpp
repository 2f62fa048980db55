#include "install/admin/formats/value_type.h"

#include <array>

namespace kz7 {

std::string_view typeName(ValueType type) {
    // clang-format off
    static constexpr std::array<std::string_view, 12> kNames = {
        "REG_NONE", "REG_SZ", "REG_EXPAND_SZ", "REG_BINARY", "REG_DWORD", "REG_DWORD_BIG_ENDIAN",
        "REG_LINK", "REG_MULTI_SZ", "REG_RESOURCE_LIST", "REG_FULL_RESOURCE_DESCRIPTOR",
        "REG_RESOURCE_REQUIREMENTS_LIST", "REG_QWORD",
    };
    // clang-format on
    const auto number = static_cast<std::size_t>(plainType(type));
    return number < kNames.size() ? kNames[number] : std::string_view{};
}

bool numberOf(ValueType type, std::string_view data, std::uint64_t& number) {
    if (!(type == ValueType::dword && data.size() == 4) && !(type == ValueType::qword && data.size() == 8)) {
        return false;
    }
    std::uint64_t read = 0;
    for (std::size_t at = data.size(); at-- > 0;) {
        read = read << 8 | static_cast<unsigned char>(data[at]);
    }
    number = read;
    return true;
}

}  // namespace kz7
