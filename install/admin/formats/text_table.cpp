#include "install/admin/formats/text_table.h"

#include <algorithm>
#include <numeric>
#include <string_view>

#include "install/platform/text.h"
#include "install/runtime/observers/text_columns.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kGap = 2;
constexpr std::uint32_t kLeastWidth = 12;  // of a column whose cells are wrapped

using Widths = std::vector<std::uint32_t>;

Widths widthsOf(const std::vector<TableRow>& rows) {
    Widths widths(rows.empty() ? 0 : rows.front().size());
    for (const TableRow& row : rows) {
        for (std::size_t column = 0; column < widths.size(); ++column) {
            widths[column] = std::max(widths[column], columnsOf(row[column]));
        }
    }
    return widths;
}

// Takes columns off the widest cells until a row fits.
bool fit(Widths& widths, std::uint32_t columns) {
    while (std::accumulate(widths.begin(), widths.end(), kGap * static_cast<std::uint32_t>(widths.size() - 1)) >
           columns) {
        const auto widest = std::max_element(widths.begin(), widths.end());
        if (*widest <= kLeastWidth) {
            return false;
        }
        --*widest;
    }
    return true;
}

void appendRow(const TableRow& row, const Widths& widths, std::string& text) {
    std::vector<std::string_view> rest(row.begin(), row.end());
    do {
        std::string line;
        for (std::size_t column = 0; column < widths.size(); ++column) {
            const std::string_view cell = takeWrappedLine(rest[column], widths[column]);
            line.append(cell).append(kGap + widths[column] - std::min(columnsOf(cell), widths[column]), ' ');
        }
        line.resize(line.find_last_not_of(' ') + 1);
        text += line + '\n';
    } while (std::any_of(rest.begin(), rest.end(), [](std::string_view cell) { return !cell.empty(); }));
}

}  // namespace

std::string tableText(const std::vector<TableRow>& rows, std::uint32_t columns) {
    Widths widths = widthsOf(rows);
    std::string text;
    if (rows.empty() || columns == 0 || fit(widths, columns)) {
        for (const TableRow& row : rows) {
            appendRow(row, widths, text);
        }
        return text;
    }
    const Widths headings = widthsOf({rows.front()});
    const std::uint32_t label = *std::max_element(headings.begin(), headings.end());
    const Widths list = {label, std::max(columns, label + kGap + kLeastWidth) - label - kGap};
    for (std::size_t row = 1; row < rows.size(); ++row) {
        text += row == 1 ? "" : "\n";
        for (std::size_t column = 0; column < widths.size(); ++column) {
            appendRow({rows.front()[column], rows[row][column]}, list, text);
        }
    }
    return text;
}

}  // namespace kz7
