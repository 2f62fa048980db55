#include "install/platform/embedded/paths.h"

#include <dirent.h>

#include <algorithm>
#include <cerrno>
#include <memory>

namespace kz7 {
namespace {

constexpr bool isLetter(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
}

}  // namespace

std::string hostPath(std::string_view productPath, const std::string& stateDirectory) {
    std::string path(productPath);
    std::replace(path.begin(), path.end(), '\\', '/');
    if (path.empty() || path.find('\0') != std::string::npos) {
        return {};
    }
    if (path.front() == '/') {
        return path;
    }
    if (path.size() < 3 || !isLetter(path[0]) || path[1] != ':' || path[2] != '/') {
        return {};
    }
    if ((path + '/').find("/../") != std::string::npos) {
        return {};
    }
    const char drive = static_cast<char>(path[0] | 0x20);
    return stateDirectory + "/drive_" + drive + path.substr(2);
}

int namesIn(const std::string& directory, std::vector<std::string>& names) {
    const std::unique_ptr<DIR, int (*)(DIR*)> entries(opendir(directory.c_str()), closedir);
    if (entries == nullptr) {
        return errno;
    }
    while (const dirent* entry = readdir(entries.get())) {
        names.emplace_back(entry->d_name);
    }
    std::sort(names.begin(), names.end());
    return 0;
}

}  // namespace kz7
