// Where the product's paths lie on this host.
#pragma once

#include <string>
#include <string_view>

namespace kz7 {

// The host's path for one of the product's: `X:\a\b` lies in `<stateDirectory>/drive_x/a/b`, one that begins
// with a separator is the host's own; backslashes separate in all of them. Empty for a path that names
// nothing here: a relative one, an empty one, one that climbs out of a drive with "..", or one with a NUL.
std::string hostPath(std::string_view productPath, const std::string& stateDirectory);

}  // namespace kz7
