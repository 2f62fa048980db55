// Which of the product's paths name something here.
#pragma once

#include <string_view>

namespace kz7 {

// From the root of a drive or from a leading separator: one that hangs on no current folder.
constexpr bool isFromRoot(std::string_view path) {
    if (path.size() > 1 && path[1] == ':') {
        path.remove_prefix(2);
    }
    return path.starts_with('\\') || path.starts_with('/');
}

}  // namespace kz7
