// Escapes foreign text for terminals.
#pragma once

#include <string>
#include <string_view>

namespace kz7 {

// The text with control characters, and characters that change the direction of writing, escaped.
std::string shownText(std::string_view foreign);

}  // namespace kz7
