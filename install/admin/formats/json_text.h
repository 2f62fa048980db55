// Pieces of JSON for what programs read. Texts are UTF-8; a lone surrogate, which UTF-8 has no form for, is
// written as its escape.
#pragma once

#include <string>
#include <string_view>

namespace kz7 {

// A text of the machine's narrow encoding, in quotation marks.
void appendJsonText(std::string_view narrow, std::string& json);

}  // namespace kz7
