#include "install/platform/text.h"

#include <algorithm>
#include <cassert>

namespace kz7 {

std::string foldUpper(std::string_view text) {
    std::string folded(text);
    std::transform(folded.begin(), folded.end(), folded.begin(), [](char c) { return foldUpper(c); });
    return folded;
}

bool equalsIgnoreCase(std::string_view left, std::string_view right) {
    return left.size() == right.size() && std::equal(left.begin(), left.end(), right.begin(),
                                                     [](char a, char b) { return foldUpper(a) == foldUpper(b); });
}

std::string compose(std::string_view pattern, std::initializer_list<Insert> inserts) {
    std::string text;
    text.reserve(pattern.size() + 32 * inserts.size());
    const auto* next = inserts.begin();
    for (std::size_t at = 0; at < pattern.size();) {
        const std::size_t percent = std::min(pattern.find('%', at), pattern.size());
        const char kind = percent + 1 < pattern.size() ? pattern[percent + 1] : '\0';
        const bool isPlaceholder = kind == '%' || kind == 's' || kind == 'd' || kind == 'u';
        text += pattern.substr(at, percent - at + (isPlaceholder ? 0 : 1));
        at = percent + (isPlaceholder ? 2 : 1);
        if (!isPlaceholder) {
            continue;
        }
        if (kind == '%') {
            text += '%';
            continue;
        }
        assert(next != inserts.end());
        const Insert& insert = *next++;
        if (const auto* shown = std::get_if<std::string_view>(&insert)) {
            text += *shown;
        } else if (kind == 'd') {
            text += std::to_string(static_cast<std::int32_t>(std::get<std::uint32_t>(insert)));
        } else {
            text += std::to_string(std::get<std::uint32_t>(insert));
        }
    }
    assert(next == inserts.end());
    return text;
}

}  // namespace kz7
