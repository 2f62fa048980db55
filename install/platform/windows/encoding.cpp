// Narrow texts are in the active code page here.
#include "install/platform/encoding.h"

#include <windows.h>

#include <algorithm>

#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

bool isAscii(std::string_view text) {
    return std::all_of(text.begin(), text.end(), [](char c) { return static_cast<unsigned char>(c) < 0x80; });
}

// In the code page, or in the closest characters that it has.
void appendNarrow(std::u16string_view utf16, std::string& narrow) {
    if (utf16.empty()) {
        return;
    }
    const auto* text = reinterpret_cast<const wchar_t*>(utf16.data());
    const int length = static_cast<int>(utf16.size());
    const std::size_t before = narrow.size();
    narrow.resize(before +
                  static_cast<std::size_t>(WideCharToMultiByte(CP_ACP, 0, text, length, nullptr, 0, nullptr, nullptr)));
    WideCharToMultiByte(CP_ACP, 0, text, length, narrow.data() + before, static_cast<int>(narrow.size() - before),
                        nullptr, nullptr);
}

}  // namespace

std::u16string utf16FromText(std::string_view text) {
    std::u16string utf16;
    utf16.reserve(text.size());
    while (!text.empty()) {
        char32_t character = static_cast<unsigned char>(text[0]);
        if (character < 0x80) {
            utf16 += static_cast<char16_t>(character);
            text.remove_prefix(1);
            continue;
        }
        if (!takeUtf8(text, character)) {
            character = 0xDC00 + static_cast<unsigned char>(text[0]);
            text.remove_prefix(1);
        }
        appendUtf16(utf16, character);
    }
    return utf16;
}

std::string textFromUtf16(std::u16string_view utf16) {
    return utf8FromUtf16(utf16);
}

std::string textFromNarrow(std::string_view narrow) {
    if (isAscii(narrow)) {
        return std::string(narrow);
    }
    const int size = static_cast<int>(narrow.size());
    std::wstring wide(narrow.size(), L'\0');
    wide.resize(static_cast<std::size_t>(
        MultiByteToWideChar(CP_ACP, 0, narrow.data(), size, wide.data(), static_cast<int>(wide.size()))));
    std::string back;
    appendNarrow(utf16View(wide), back);
    if (back == narrow) {
        return textFromWide(wide);
    }
    std::string text;
    for (const char c : narrow) {
        const char32_t byte = static_cast<unsigned char>(c);
        appendUtf8(text, byte < 0x80 ? byte : 0xDC00 + byte);
    }
    return text;
}

std::string narrowFromText(std::string_view text) {
    if (isAscii(text)) {
        return std::string(text);
    }
    const std::u16string utf16 = utf16FromText(text);
    std::string narrow;
    std::size_t begin = 0;  // of what is not yet converted
    for (std::u16string_view rest = utf16; !rest.empty();) {
        const std::size_t at = utf16.size() - rest.size();
        const char32_t character = takeUtf16(rest);
        if (isByteSurrogate(character)) {
            appendNarrow(std::u16string_view(utf16).substr(begin, at - begin), narrow);
            narrow += static_cast<char>(character - 0xDC00);
            begin = at + 1;
        }
    }
    appendNarrow(std::u16string_view(utf16).substr(begin), narrow);
    return narrow;
}

}  // namespace kz7
