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
    const auto* next = inserts.begin();
    for (std::size_t at = 0; at < pattern.size(); ++at) {
        const char kind = pattern[at] == '%' && at + 1 < pattern.size() ? pattern[at + 1] : '\0';
        if (kind != '%' && kind != 's' && kind != 'd' && kind != 'u') {
            text += pattern[at];
            continue;
        }
        ++at;
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
