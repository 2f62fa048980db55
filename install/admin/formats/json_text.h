// Pieces of JSON for what programs read. Texts are UTF-8; a lone surrogate, which UTF-8 has no form for, is
// written as its escape.
#pragma once

#include <string>
#include <string_view>

namespace kz7 {

// A text in quotation marks.
void appendJsonText(std::string_view text, std::string& json);

}  // namespace kz7
