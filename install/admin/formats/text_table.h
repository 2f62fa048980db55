// Rows of texts in columns that line up, for reading.
#pragma once

#include <string>
#include <vector>

namespace kz7 {

using TableRow = std::vector<std::string>;

// A line for each row, all of the first one's length; columns are as wide as their widest text.
std::string tableText(const std::vector<TableRow>& rows);

}  // namespace kz7
