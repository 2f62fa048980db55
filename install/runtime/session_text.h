// Texts for records of the installer session.
#pragma once

#include <string>
#include <string_view>

namespace kz7 {

// The text so that the installer shows it as it is: it would put the value of a property, a password too, in
// place of every "[Name]".
std::string escapedForSession(std::string_view text);

}  // namespace kz7
