// Maps product paths to host paths.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace kz7 {

// `X:\a\b` maps to `<stateDirectory>/drive_x/a/b`; a path that begins with a separator is a host path. A backslash is a
// separator in both. The result is empty for a path that names nothing: an empty or relative path, one that leaves a
// drive through "..", or one with a NUL.
std::string hostPath(std::string_view productPath, const std::string& stateDirectory);

// The names in a host directory, sorted. 0 or an error number. (The iterators of the C++ library end the process if
// they cannot allocate memory.)
int namesIn(const std::string& directory, std::vector<std::string>& names);

}  // namespace kz7
