#include "install/admin/formats/text_table.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::size_t kGap = 2;

std::size_t widthOf(const std::string& text) {
    return textLength(text);
}

}  // namespace

std::string tableText(const std::vector<TableRow>& rows) {
    std::vector<std::size_t> widths(rows.empty() ? 0 : rows.front().size());
    for (const TableRow& row : rows) {
        for (std::size_t column = 0; column < widths.size(); ++column) {
            widths[column] = std::max(widths[column], widthOf(row[column]));
        }
    }
    std::string text;
    for (const TableRow& row : rows) {
        for (std::size_t column = 0; column < widths.size(); ++column) {
            text += row[column];
            if (column + 1 < widths.size()) {
                text.append(widths[column] - widthOf(row[column]) + kGap, ' ');
            }
        }
        text += '\n';
    }
    return text;
}

}  // namespace kz7
