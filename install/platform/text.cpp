#include "install/platform/text.h"

#include <algorithm>
#include <cassert>

#include "install/platform/encoding.h"

namespace kz7 {
namespace {

// Hands out the pieces of the composed text in order; returns the number of placeholders.
template <typename Append>
std::size_t walkPattern(std::string_view pattern, std::span<const Insert> inserts, const Append& append) {
    std::size_t placeholders = 0;
    for (std::size_t at = 0; at < pattern.size();) {
        const std::size_t percent = std::min(pattern.find('%', at), pattern.size());
        const std::string_view mark = pattern.substr(percent, 2);
        append(pattern.substr(at, percent - at));
        at = percent + mark.size();
        if (mark == "%%") {
            append("%");
        } else if (mark != "%s" && mark != "%d" && mark != "%u") {
            append(mark.substr(0, 1));
            at = percent + std::min<std::size_t>(mark.size(), 1);
        } else if (placeholders++ >= inserts.size()) {
            continue;
        } else if (const auto* shown = std::get_if<std::string_view>(&inserts[placeholders - 1])) {
            append(*shown);
        } else {
            const auto number = std::get<std::uint32_t>(inserts[placeholders - 1]);
            append(mark == "%d" ? std::to_string(static_cast<std::int32_t>(number)) : std::to_string(number));
        }
    }
    return placeholders;
}

// Takes a character, or a byte that is part of none, off a text that is not empty; the result is its UTF-16 units.
std::size_t takeUnits(std::string_view& text) {
    char32_t character = 0;
    if (static_cast<unsigned char>(text.front()) < 0x80 || !takeUtf8(text, character)) {
        text.remove_prefix(1);
    }
    return character < 0x10000 ? 1 : 2;
}

bool steersTerminal(char32_t character) {
    return character < 0x20 || (character >= 0x7F && character < 0xA0) || isSurrogate(character) ||
           character == 0x061C || character == 0x200E || character == 0x200F ||
           (character >= 0x2028 && character <= 0x202E) || (character >= 0x2066 && character <= 0x2069) ||
           character == 0xFEFF;
}

}  // namespace

std::size_t textLength(std::string_view text) {
    std::size_t length = 0;
    while (!text.empty()) {
        length += takeUnits(text);
    }
    return length;
}

std::string_view cutText(std::string_view text, std::size_t limit) {
    if (text.size() <= limit) {
        return text;
    }
    std::string_view rest = text;
    std::string_view next = text;
    for (std::size_t length = 0; !next.empty() && (length += takeUnits(next)) <= limit;) {
        rest = next;
    }
    return text.substr(0, text.size() - rest.size());
}

std::string foldUpper(std::string_view text) {
    std::string folded(text);
    std::transform(folded.begin(), folded.end(), folded.begin(), [](char c) { return foldUpper(c); });
    return folded;
}

bool equalsIgnoreCase(std::string_view left, std::string_view right) {
    // Most texts that are compared are spelled alike.
    return left == right ||
           (left.size() == right.size() && std::equal(left.begin(), left.end(), right.begin(),
                                                      [](char a, char b) { return foldUpper(a) == foldUpper(b); }));
}

void appendHex(std::uint64_t number, int digits, std::string& text) {
    static constexpr char kDigits[] = "0123456789abcdef";
    while (digits-- > 0) {
        text += kDigits[number >> (4 * digits) & 15];
    }
}

std::string compose(std::string_view pattern, std::initializer_list<Insert> inserts) {
    std::string text;
    text.reserve(pattern.size() + 32 * inserts.size());
    const std::size_t placeholders =
        walkPattern(pattern, {inserts.begin(), inserts.size()}, [&text](std::string_view piece) { text += piece; });
    assert(placeholders == inserts.size());
    static_cast<void>(placeholders);
    return text;
}

std::size_t composeInto(char* room, std::size_t size, std::string_view pattern, std::span<const Insert> inserts) {
    std::size_t length = 0;
    walkPattern(pattern, inserts, [&](std::string_view piece) {
        if (length < size) {
            piece.copy(room + length, size - length);
        }
        length += piece.size();
    });
    return length;
}

std::string shownText(std::string_view foreign) {
    const std::u16string utf16 = utf16FromText(foreign);
    std::u16string shown;
    for (std::u16string_view rest = utf16; !rest.empty();) {
        const char32_t character = takeUtf16(rest);
        if (!steersTerminal(character)) {
            appendUtf16(shown, character);
            continue;
        }
        // A byte that is no character shows as the byte it is.
        const bool isByte = character < 0x80 || isSurrogate(character);
        std::string escape = isByte ? "\\x" : "\\u";
        appendHex(character, isByte ? 2 : 4, escape);
        shown.append(escape.begin(), escape.end());
    }
    return textFromUtf16(shown);
}

}  // namespace kz7
