// Texts for records of the installer session.
#pragma once

#include <string>
#include <string_view>

namespace kz7 {

// Escapes the text so that the installer shows it unchanged. It would replace every "[Name]" with the value of that
// property, which may be a password.
std::string escapedForSession(std::string_view text);

}  // namespace kz7
