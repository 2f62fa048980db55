// Tables for reading: rows of text in aligned columns.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace kz7 {

using TableRow = std::vector<std::string>;

// All rows have the length of the first one, which holds the headings. `columns` is the width of the terminal; 0: no
// limit. Cells of wide columns are wrapped to fit it. If that does not suffice, each row is a list of its headings and
// cells.
std::string tableText(const std::vector<TableRow>& rows, std::uint32_t columns);

}  // namespace kz7
