// Text outside this machine's narrow encoding: UTF-8 and UTF-16, as files and other programs hold it. Both
// forms may hold lone surrogates, in UTF-8 as three bytes; they carry what has no character of its own.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace kz7 {

constexpr bool isSurrogate(char32_t character) {
    return character >= 0xD800 && character <= 0xDFFF;
}

// Takes one character or lone surrogate off a text that is not empty.
char32_t takeUtf16(std::u16string_view& text);

// The same for UTF-8; false, with nothing taken, where the text does not begin with a character.
bool takeUtf8(std::string_view& text, char32_t& character);

void appendUtf16(std::u16string& text, char32_t character);
void appendUtf8(std::string& text, char32_t character);

// False where the text is no UTF-8.
bool utf16FromUtf8(std::string_view utf8, std::u16string& utf16);
std::string utf8FromUtf16(std::u16string_view utf16);

// The machine's narrow text, the one that the ports take and give. A byte that is no character becomes the
// lone surrogate U+DC00 + byte where the narrow encoding leaves such bytes.
std::u16string utf16FromNarrow(std::string_view narrow);

// The way back, exact for everything that came from there. False where the narrow encoding has no form for a
// character.
bool narrowFromUtf16(std::u16string_view utf16, std::string& narrow);

}  // namespace kz7
