// Texts are UTF-8 here, but nothing keeps other bytes out of them.
#include "install/platform/encoding.h"

namespace kz7 {
namespace {

bool isLeading(char32_t character) {
    return character >= 0xD800 && character <= 0xDBFF;
}

// The size of the unpaired leading surrogates that the text begins with; 0 where a trailing one or a byte follows
// them, which in UTF-16 would make a pair with the last of them. Then `bytes` is the size of those that must travel
// byte by byte.
std::size_t leadingSurrogates(std::string_view text, std::size_t& bytes) {
    std::string_view rest = text;
    char32_t character = 0;
    std::size_t size = 0;
    bool taken = false;
    while ((taken = !rest.empty() && takeUtf8(rest, character)) && isLeading(character)) {
        size = text.size() - rest.size();
    }
    const bool pairs = size != 0 && size != text.size() && (!taken || isSurrogate(character));
    bytes = pairs ? size : 0;
    return pairs ? 0 : size;
}

}  // namespace

std::u16string utf16FromText(std::string_view text) {
    std::u16string utf16;
    utf16.reserve(text.size());
    std::size_t surrogates = 0;  // bytes of leading surrogates that the rest begins with
    std::size_t bytes = 0;       // bytes that travel one by one
    while (!text.empty()) {
        std::string_view rest = text;
        char32_t character = 0;
        if (surrogates == 0 && bytes == 0 && text[0] == '\xED') {
            surrogates = leadingSurrogates(text, bytes);
        }
        // The three bytes of a byte's surrogate travel byte by byte, so that the way back cannot take them for a byte.
        if (bytes != 0 || !takeUtf8(rest, character) || isByteSurrogate(character)) {
            character = 0xDC00 + static_cast<unsigned char>(text[0]);
            rest = text.substr(1);
            bytes -= bytes != 0 ? 1 : 0;
        }
        surrogates -= surrogates != 0 ? 3 : 0;
        appendUtf16(utf16, character);
        text = rest;
    }
    return utf16;
}

std::string textFromUtf16(std::u16string_view utf16) {
    std::string text;
    text.reserve(utf16.size());
    while (!utf16.empty()) {
        const char32_t character = takeUtf16(utf16);
        if (isByteSurrogate(character)) {
            text += static_cast<char>(character - 0xDC00);
        } else {
            appendUtf8(text, character);
        }
    }
    return text;
}

std::string textFromNarrow(std::string_view narrow) {
    return std::string(narrow);
}

std::string narrowFromText(std::string_view text) {
    return std::string(text);
}

}  // namespace kz7
