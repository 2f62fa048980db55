// Narrow text is UTF-8 here, but nothing keeps other bytes out of it.
#include "install/platform/encoding.h"

namespace kz7 {

std::u16string utf16FromNarrow(std::string_view narrow) {
    std::u16string utf16;
    utf16.reserve(narrow.size());
    while (!narrow.empty()) {
        std::string_view rest = narrow;
        char32_t character = 0;
        // A surrogate's three bytes are no character either: they travel byte by byte, so that the way back
        // cannot take them for a byte that travelled alone.
        if (!takeUtf8(rest, character) || isSurrogate(character)) {
            character = 0xDC00 + static_cast<unsigned char>(narrow[0]);
            rest = narrow.substr(1);
        }
        appendUtf16(utf16, character);
        narrow = rest;
    }
    return utf16;
}

bool narrowFromUtf16(std::u16string_view utf16, std::string& narrow) {
    std::string taken;
    taken.reserve(utf16.size());
    while (!utf16.empty()) {
        const char32_t character = takeUtf16(utf16);
        if (character >= 0xDC80 && character <= 0xDCFF) {
            taken += static_cast<char>(character - 0xDC00);
        } else if (isSurrogate(character)) {
            return false;
        } else {
            appendUtf8(taken, character);
        }
    }
    narrow = std::move(taken);
    return true;
}

}  // namespace kz7
