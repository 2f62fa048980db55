// Which paths name one place on Windows, wherever the process stands.
#pragma once

#include <string_view>

namespace kz7 {

constexpr bool isPathSeparator(char c) {
    return c == '\\' || c == '/';
}

// A drive with its root, or a share. `\x` and `C:x` depend on the directory the process was started in.
constexpr bool isAbsolutePath(std::string_view path) {
    return path.size() >= 3 &&
           ((path[1] == ':' && isPathSeparator(path[2])) || (isPathSeparator(path[0]) && isPathSeparator(path[1])));
}

}  // namespace kz7
