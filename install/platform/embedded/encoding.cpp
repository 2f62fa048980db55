// Texts are UTF-8 here, but may contain other bytes.
#include "install/platform/encoding.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

bool isLeading(char32_t character) {
    return character >= 0xD800 && character <= 0xDBFF;
}

// The size in bytes of the unpaired leading surrogates at the beginning of the text; 0 if a trailing one or a byte
// follows, which would form a pair with the last of them in UTF-16. `bytes` is then the size of those that must be
// encoded byte by byte.
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
    std::size_t surrogates = 0;  // bytes of leading surrogates at the beginning of the rest
    std::size_t bytes = 0;       // bytes that are encoded one by one
    while (!text.empty()) {
        std::string_view rest = text;
        char32_t character = 0;
        if (surrogates == 0 && bytes == 0 && text[0] == '\xED') {
            surrogates = leadingSurrogates(text, bytes);
        }
        // The three bytes of the surrogate of a byte are encoded byte by byte, so that decoding cannot take them for
        // the byte itself.
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

std::string foldValueName(std::string_view name) {
    return foldUpper(name);
}

}  // namespace kz7
