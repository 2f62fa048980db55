// Narrow text is in the active code page here.
#include "install/platform/encoding.h"

#include <windows.h>

namespace kz7 {

std::u16string utf16FromNarrow(std::string_view narrow) {
    static_assert(sizeof(wchar_t) == sizeof(char16_t));
    if (narrow.empty()) {
        return {};
    }
    const int size = static_cast<int>(narrow.size());
    std::u16string utf16(static_cast<std::size_t>(MultiByteToWideChar(CP_ACP, 0, narrow.data(), size, nullptr, 0)),
                         u'\0');
    MultiByteToWideChar(CP_ACP, 0, narrow.data(), size, reinterpret_cast<wchar_t*>(utf16.data()),
                        static_cast<int>(utf16.size()));
    return utf16;
}

bool narrowFromUtf16(std::u16string_view utf16, std::string& narrow) {
    if (utf16.empty()) {
        narrow.clear();
        return true;
    }
    // A code page of UTF-8 tells a character that it lacks (a lone surrogate) by another means.
    const bool utf8 = GetACP() == CP_UTF8;
    const DWORD flags = utf8 ? WC_ERR_INVALID_CHARS : WC_NO_BEST_FIT_CHARS;
    const auto* text = reinterpret_cast<const wchar_t*>(utf16.data());
    const int length = static_cast<int>(utf16.size());
    BOOL lost = FALSE;
    const int size = WideCharToMultiByte(CP_ACP, flags, text, length, nullptr, 0, nullptr, utf8 ? nullptr : &lost);
    if (size == 0 || lost) {
        return false;
    }
    narrow.resize(static_cast<std::size_t>(size));
    WideCharToMultiByte(CP_ACP, flags, text, length, narrow.data(), size, nullptr, nullptr);
    return true;
}

}  // namespace kz7
