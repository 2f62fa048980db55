#include "install/platform/text.h"

#include <algorithm>
#include <array>
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

struct CharacterRange {
    char32_t first;
    char32_t last;
};

// clang-format off
constexpr std::array<CharacterRange, 9> kWithoutColumn = {{
    {0x0300, 0x036F}, {0x0483, 0x0489}, {0x0591, 0x05BD}, {0x1AB0, 0x1AFF}, {0x1DC0, 0x1DFF}, {0x200B, 0x200F},
    {0x20D0, 0x20FF}, {0xFE00, 0xFE0F}, {0xFE20, 0xFE2F},
}};
constexpr std::array<CharacterRange, 13> kOfTwoColumns = {{
    {0x1100, 0x115F}, {0x2E80, 0x303E}, {0x3041, 0x33FF}, {0x3400, 0x4DBF}, {0x4E00, 0xA4CF}, {0xA960, 0xA97F},
    {0xAC00, 0xD7A3}, {0xF900, 0xFAFF}, {0xFE30, 0xFE6F}, {0xFF01, 0xFF60}, {0xFFE0, 0xFFE6}, {0x1F300, 0x1FAFF},
    {0x20000, 0x3FFFD},
}};
// clang-format on

bool isIn(std::span<const CharacterRange> ranges, char32_t character) {
    return std::any_of(ranges.begin(), ranges.end(), [character](const CharacterRange& range) {
        return character >= range.first && character <= range.last;
    });
}

// Takes a character off a text that is not empty; 0 for an ASCII character and for a byte that is part of none.
char32_t takeCharacter(std::string_view& text) {
    char32_t character = 0;
    if (static_cast<unsigned char>(text.front()) < 0x80 || !takeUtf8(text, character)) {
        text.remove_prefix(1);
    }
    return character;
}

// The same; the result is its UTF-16 units.
std::size_t takeUnits(std::string_view& text) {
    return takeCharacter(text) < 0x10000 ? 1 : 2;
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

std::uint32_t takeColumns(std::string_view& text) {
    const char32_t character = takeCharacter(text);
    return isIn(kWithoutColumn, character) ? 0 : isIn(kOfTwoColumns, character) ? 2 : 1;
}

std::uint32_t columnsOf(std::string_view text) {
    std::uint32_t columns = 0;
    while (!text.empty()) {
        columns += takeColumns(text);
    }
    return columns;
}

std::string_view takeWrappedLine(std::string_view& text, std::uint32_t columns) {
    std::size_t end = 0;
    std::size_t blank = std::string_view::npos;
    std::uint32_t shown = 0;
    while (end < text.size() && text[end] != '\n') {
        std::string_view rest = text.substr(end);
        const std::uint32_t width = takeColumns(rest);
        shown += width;
        // A character wider than the terminal stands alone.
        if (columns != 0 && shown > columns && width != 0 && end != 0 && text[end] != ' ') {
            end = std::min(blank, end);
            break;
        }
        if (text[end] == ' ') {
            blank = end;
        }
        end = text.size() - rest.size();
    }
    const std::string_view line = text.substr(0, end);
    text.remove_prefix(end);
    text.remove_prefix(!text.empty() && (text.front() == '\n' || text.front() == ' ') ? 1 : 0);
    return line;
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
