#include "install/admin/formats/value_type.h"

#include <array>
#include <cstdio>

#include "install/platform/text.h"

namespace kz7 {
namespace {

std::string hexNumber(std::uint64_t number) {
    char text[19];
    std::snprintf(text, sizeof text, "0x%llx", static_cast<unsigned long long>(number));
    return text;
}

// The NUL-terminated texts of the data in quotation marks; notes a missing terminator.
std::string shownTexts(std::string_view data) {
    std::string shown;
    while (!data.empty()) {
        const std::size_t end = data.find('\0');
        shown += " \"" + shownText(data.substr(0, end)) + '"';
        if (end == std::string_view::npos) {
            return shown + " (no NUL terminator)";
        }
        data.remove_prefix(end + 1);
    }
    return shown;
}

}  // namespace

std::string typeName(ValueType type) {
    // clang-format off
    static constexpr std::array<std::string_view, 12> kNames = {
        "REG_NONE", "REG_SZ", "REG_EXPAND_SZ", "REG_BINARY", "REG_DWORD", "REG_DWORD_BIG_ENDIAN",
        "REG_LINK", "REG_MULTI_SZ", "REG_RESOURCE_LIST", "REG_FULL_RESOURCE_DESCRIPTOR",
        "REG_RESOURCE_REQUIREMENTS_LIST", "REG_QWORD",
    };
    // clang-format on
    const auto number = static_cast<std::size_t>(plainType(type));
    return number < kNames.size() ? std::string(kNames[number]) : "type " + std::to_string(number);
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

std::string shownData(ValueType type, std::string_view data) {
    std::uint64_t number = 0;
    switch (type) {
        case ValueType::sz:
        case ValueType::expandSz:
        case ValueType::multiSz:
            return shownTexts(data);
        default:
            break;
    }
    if (numberOf(type, data, number)) {
        return " " + std::to_string(number) + " (" + hexNumber(number) + ")";
    }
    std::string shown;
    for (const char c : data) {
        shown += ' ';
        appendHex(static_cast<unsigned char>(c), 2, shown);
    }
    return shown;
}

void appendData(ValueType type, std::string_view data, JsonWriter& json) {
    std::string bytes = "\"";
    for (const char c : data) {
        appendHex(static_cast<unsigned char>(c), 2, bytes);
    }
    json.field("type", static_cast<std::uint32_t>(type)).field("bytes").raw(bytes + '"');
    std::uint64_t number = 0;
    if (type == ValueType::sz || type == ValueType::expandSz) {
        json.field("text", data.substr(0, data.find('\0')));
    } else if (numberOf(type, data, number)) {
        json.field("number", number);
    }
}

}  // namespace kz7
