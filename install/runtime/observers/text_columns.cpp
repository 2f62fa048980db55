#include "install/runtime/observers/text_columns.h"

#include <algorithm>
#include <array>
#include <span>

#include "install/platform/encoding.h"

namespace kz7 {
namespace {

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

}  // namespace

std::uint32_t takeColumns(std::string_view& text) {
    char32_t character = 0;
    if (!takeUtf8(text, character)) {
        text.remove_prefix(1);
    }
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

}  // namespace kz7
