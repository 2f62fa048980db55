// Conversions of text: UTF-8, UTF-16, the text of the ports, and the narrow encoding of the machine.
//
// The text of the ports is UTF-8 on every host. All functions here accept unpaired surrogates, which are three bytes
// in UTF-8.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace kz7 {

constexpr bool isSurrogate(char32_t character) {
    return character >= 0xD800 && character <= 0xDFFF;
}

// A byte that is not part of a character is the surrogate U+DC00 + byte in UTF-16.
constexpr bool isByteSurrogate(char32_t character) {
    return character >= 0xDC80 && character <= 0xDCFF;
}

// Takes one character or unpaired surrogate off a text that is not empty.
char32_t takeUtf16(std::u16string_view& text);

// The same for UTF-8. False if the text does not begin with a character; it is then unchanged.
bool takeUtf8(std::string_view& text, char32_t& character);

void appendUtf16(std::u16string& text, char32_t character);
void appendUtf8(std::string& text, char32_t character);

// False if the text is not UTF-8.
bool utf16FromUtf8(std::string_view utf8, std::u16string& utf16);
std::string utf8FromUtf16(std::u16string_view utf16);

// Little-endian bytes of UTF-16. An odd byte at the end is dropped.
std::u16string utf16FromBytes(std::string_view bytes);
std::string bytesFromUtf16(std::u16string_view utf16);

// The text of the ports in UTF-16, the exact inverse of textFromUtf16(). A byte that is not part of a character becomes
// the surrogate U+DC00 + byte.
std::u16string utf16FromText(std::string_view text);

// The text of the ports for UTF-16. A surrogate U+DC80 to U+DCFF becomes its byte on the embedded platform, whose texts
// may be any bytes, and the three bytes of a surrogate on Windows.
std::string textFromUtf16(std::u16string_view utf16);

// The narrow encoding, in which other programs read and write texts: the active code page on Windows, the text of the
// ports itself elsewhere. Bytes that are not a character of the code page become surrogates of bytes, so that
// narrowFromText(textFromNarrow(bytes)) is `bytes`, except where the code page has two codes for one character.
std::string textFromNarrow(std::string_view narrow);

// A character that the code page lacks becomes the closest one.
std::string narrowFromText(std::string_view text);

// A value's name in the upper case in which this machine's registry compares it: Windows folds letters beyond ASCII
// too.
std::string foldValueName(std::string_view name);

}  // namespace kz7
