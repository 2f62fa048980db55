// Conversions between the UTF-8 of the ports and the UTF-16 of the W calls.
#pragma once

#include <algorithm>
#include <string>
#include <string_view>

#include "install/platform/encoding.h"

namespace kz7 {

static_assert(sizeof(wchar_t) == sizeof(char16_t));

inline std::u16string_view utf16View(std::wstring_view wide) {
    return {reinterpret_cast<const char16_t*>(wide.data()), wide.size()};
}

inline std::string textFromWide(std::wstring_view wide) {
    return textFromUtf16(utf16View(wide));
}

// A text as the argument of a W call. A call without a size parameter sees it up to its first NUL.
class WideText {
public:
    explicit WideText(std::string_view text) : text_(utf16FromText(text)) {}

    const wchar_t* c_str() const { return reinterpret_cast<const wchar_t*>(text_.c_str()); }
    wchar_t* data() { return reinterpret_cast<wchar_t*>(text_.data()); }
    std::size_t size() const { return text_.size(); }

private:
    std::u16string text_;
};

// The text of a call that fills a buffer and returns the length without the NUL, the size needed, or 0 on failure.
// Empty on failure.
template <typename Call>
std::string textOf(Call call) {
    std::wstring room(260, L'\0');
    for (;;) {
        const auto length = static_cast<std::size_t>(call(room.data(), static_cast<unsigned long>(room.size())));
        if (length < room.size()) {
            return textFromWide(std::wstring_view(room).substr(0, length));
        }
        room.resize(std::max(length + 1, 2 * room.size()));
    }
}

}  // namespace kz7
