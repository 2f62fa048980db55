#include "install/admin/formats/json_text.h"

#include "install/platform/encoding.h"
#include "install/platform/text.h"

namespace kz7 {

void appendJsonText(std::string_view text, std::string& json) {
    const std::u16string utf16 = utf16FromText(text);
    json += '"';
    for (std::u16string_view rest = utf16; !rest.empty();) {
        const char32_t character = takeUtf16(rest);
        if (character < 0x20 || (character >= 0x7F && character < 0xA0) || isSurrogate(character)) {
            json += "\\u";
            appendHex(character, 4, json);
            continue;
        }
        if (character == '"' || character == '\\') {
            json += '\\';
        }
        appendUtf8(json, character);
    }
    json += '"';
}

}  // namespace kz7
