#include "install/platform/file_system.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {

Status findFile(IFileSystem& files, std::string_view pattern, std::string& name) {
    const std::string_view wanted = pattern.substr(pattern.find_last_of("\\/") + 1);
    std::vector<std::string> names;
    if (const Status status = files.listFiles(pattern.substr(0, pattern.size() - wanted.size()), names);
        status != kSuccess) {
        return status;
    }
    const auto found = std::find_if(names.begin(), names.end(), [wanted](const std::string& each) {
        return std::equal(each.begin(), each.end(), wanted.begin(), wanted.end(),
                          [](char a, char b) { return b == '?' || foldUpper(a) == foldUpper(b); });
    });
    if (found == names.end()) {
        return kFileNotFound;
    }
    name = std::move(*found);
    return kSuccess;
}

}  // namespace kz7
