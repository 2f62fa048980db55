// Foreign text on its way to a terminal.
#pragma once

#include <string>
#include <string_view>

namespace kz7 {

// Foreign text for a line of ours: control characters, and what turns the direction of writing, are escaped.
std::string shownText(std::string_view foreign);

}  // namespace kz7
