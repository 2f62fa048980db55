// The width of texts on a terminal.
#pragma once

#include <cstdint>
#include <string_view>

namespace kz7 {

// Takes a character off a text that is not empty and returns the columns that it takes on a terminal: 0 for a combining
// mark, 2 for a wide character of East Asia and for most emoji. A byte that is not part of a character takes one.
std::uint32_t takeColumns(std::string_view& text);

std::uint32_t columnsOf(std::string_view text);

// Takes the next line of at most `columns` columns off a text, broken at a blank if it has one; with 0 columns it
// is not broken.
std::string_view takeWrappedLine(std::string_view& text, std::uint32_t columns);

}  // namespace kz7
