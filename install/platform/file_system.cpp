#include "install/platform/file_system.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {

bool fitsPattern(std::string_view name, std::string_view pattern) {
    return std::equal(name.begin(), name.end(), pattern.begin(), pattern.end(),
                      [](char a, char b) { return b == '?' || foldUpper(a) == foldUpper(b); });
}

}  // namespace kz7
