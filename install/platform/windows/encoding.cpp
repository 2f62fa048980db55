// Narrow texts are in the active code page.
#include "install/platform/encoding.h"

#include <windows.h>

#include <algorithm>

#include "install/platform/windows/wide_text.h"

// The registry's own upper case.
extern "C" WCHAR NTAPI RtlUpcaseUnicodeChar(WCHAR character);

namespace kz7 {
namespace {

bool isAscii(std::string_view text) {
    return std::all_of(text.begin(), text.end(), [](char c) { return static_cast<unsigned char>(c) < 0x80; });
}

constexpr std::size_t kLongestCharacter = 4;  // bytes, in any code page

// False, and `wide` is as before, for bytes that are not a text of the code page.
bool appendWide(std::string_view narrow, std::wstring& wide) {
    const int length = static_cast<int>(narrow.size());
    const int units = MultiByteToWideChar(CP_ACP, MB_ERR_INVALID_CHARS, narrow.data(), length, nullptr, 0);
    const std::size_t before = wide.size();
    wide.resize(before + static_cast<std::size_t>(units));
    return MultiByteToWideChar(CP_ACP, MB_ERR_INVALID_CHARS, narrow.data(), length, wide.data() + before, units) != 0;
}

// Characters that the code page lacks become its closest ones.
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
    std::wstring wide;
    if (appendWide(narrow, wide)) {
        return textFromWide(wide);
    }
    while (!narrow.empty()) {
        std::size_t length = 1;
        while (length <= kLongestCharacter && !appendWide(narrow.substr(0, length), wide)) {
            ++length;
        }
        if (length > kLongestCharacter) {
            wide += static_cast<wchar_t>(0xDC00 + static_cast<unsigned char>(narrow[0]));
            length = 1;
        }
        narrow.remove_prefix(std::min(length, narrow.size()));
    }
    return textFromWide(wide);
}

std::string narrowFromText(std::string_view text) {
    if (isAscii(text)) {
        return std::string(text);
    }
    const std::u16string utf16 = utf16FromText(text);
    std::string narrow;
    std::size_t begin = 0;  // of the part that is not converted yet
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

std::string foldValueName(std::string_view name) {
    std::u16string upper = utf16FromText(name);
    for (char16_t& unit : upper) {
        unit = static_cast<char16_t>(RtlUpcaseUnicodeChar(static_cast<wchar_t>(unit)));
    }
    return textFromUtf16(upper);
}

}  // namespace kz7
