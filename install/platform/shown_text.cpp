#include "install/platform/shown_text.h"

#include "install/platform/encoding.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

bool steersTerminal(char32_t character) {
    return character < 0x20 || (character >= 0x7F && character < 0xA0) || isSurrogate(character) ||
           character == 0x061C || character == 0x200E || character == 0x200F ||
           (character >= 0x2028 && character <= 0x202E) || (character >= 0x2066 && character <= 0x2069) ||
           character == 0xFEFF;
}

}  // namespace

std::string shownText(std::string_view foreign) {
    const std::u16string utf16 = utf16FromText(foreign);
    std::u16string shown;
    for (std::u16string_view rest = utf16; !rest.empty();) {
        const char32_t character = takeUtf16(rest);
        if (!steersTerminal(character)) {
            appendUtf16(shown, character);
            continue;
        }
        // A byte that is no character shows as the byte it is.
        const bool isByte = character < 0x80 || isSurrogate(character);
        std::string escape = isByte ? "\\x" : "\\u";
        appendHex(character, isByte ? 2 : 4, escape);
        shown.append(escape.begin(), escape.end());
    }
    return textFromUtf16(shown);
}

}  // namespace kz7
