// Tests of Windows paths.
#pragma once

#include <string_view>

namespace kz7 {

constexpr bool isPathSeparator(char c) {
    return c == '\\' || c == '/';
}

// A path with a drive and its root, or a share. `\x` and `C:x` depend on the current directory.
constexpr bool isAbsolutePath(std::string_view path) {
    return path.size() >= 3 &&
           ((path[1] == ':' && isPathSeparator(path[2])) || (isPathSeparator(path[0]) && isPathSeparator(path[1])));
}

}  // namespace kz7
