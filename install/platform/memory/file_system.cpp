#include "install/platform/memory/file_system.h"

#include "install/platform/text.h"

namespace kz7 {
namespace {

// One spelling for all that name the same file; empty for a path that names nothing.
std::string keyOf(std::string_view path) {
    const bool onDrive = path.size() >= 3 && path[1] == ':' && (path[2] == '\\' || path[2] == '/');
    if (path.empty() || (!onDrive && path.front() != '\\' && path.front() != '/')) {
        return {};
    }
    std::string key;
    for (const char c : path) {
        const char folded = c == '/' ? '\\' : foldUpper(c);
        if (folded != '\\' || key.empty() || key.back() != '\\') {
            key += folded;
        }
    }
    if (key.back() == '\\') {
        key.pop_back();
    }
    return key;
}

}  // namespace

Status MemoryFileSystem::probe(std::string_view path) {
    return paths_.contains(keyOf(path)) ? kSuccess : kFileNotFound;
}

void MemoryFileSystem::add(std::string_view path) {
    for (std::string key = keyOf(path); !key.empty(); key.resize(key.find_last_of('\\'))) {
        paths_.insert(key);
        if (key.find('\\') == std::string::npos) {
            break;
        }
    }
}

void MemoryFileSystem::remove(std::string_view path) {
    paths_.erase(keyOf(path));
}

}  // namespace kz7
