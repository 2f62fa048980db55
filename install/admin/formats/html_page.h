// The parts that the HTML pages share: the frame with its style, tables and sections. No script and nothing from
// elsewhere.
#pragma once

#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

namespace kz7 {

struct PageSection {
    std::string_view id;
    std::string_view title;
};

// Up to the first section; one of them is "findings", to which readers can skip. `lines` are foreign texts below the
// title.
std::string pageStart(std::string_view title, const std::vector<std::string>& lines,
                      std::initializer_list<PageSection> sections);
std::string pageEnd();

// Foreign text as HTML that shows it.
std::string escaped(std::string_view foreign);

// The same of its first characters, at most `limit` with the ellipsis that ends a longer text.
std::string cutEscaped(std::string_view foreign, std::size_t limit);

// The caller ends it with "</section>".
void beginSection(std::string_view id, std::string_view title, std::string& html);

// Cells are HTML; the first cell of a row is its header.
void appendTable(std::string_view caption, const std::vector<std::string_view>& headings,
                 const std::vector<std::vector<std::string>>& rows, std::string& html);

}  // namespace kz7
