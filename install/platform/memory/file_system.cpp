#include "install/platform/memory/file_system.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
namespace {

// The same text for all spellings of a file's path; empty for a path that names no file.
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
    return files_.contains(keyOf(path)) ? kSuccess : kFileNotFound;
}

Status MemoryFileSystem::readFile(std::string_view path, std::string& content) {
    const auto found = files_.find(keyOf(path));
    if (found == files_.end()) {
        return kFileNotFound;
    }
    if (found->second->isFolder) {
        return kAccessDenied;
    }
    content = found->second->content;
    return kSuccess;
}

Status MemoryFileSystem::productPath(std::string_view hostPath, std::string& path) {
    path = hostPath;
    return kSuccess;
}

Status MemoryFileSystem::openForAppend(std::string_view path, FileHandle& file) {
    const std::string key = keyOf(path);
    if (key.empty()) {
        return kFileNotFound;
    }
    const std::size_t name = key.find_last_of('\\');
    if (name != 0 && name != std::string::npos && !files_.contains(key.substr(0, name))) {
        return kPathNotFound;
    }
    add(path);
    if (files_.at(key)->isFolder) {
        return kAccessDenied;
    }
    file = open_.give(files_.at(key));
    return kSuccess;
}

Status MemoryFileSystem::write(FileHandle file, std::string_view data, std::uint32_t& written) {
    written = 0;
    const auto* const open = open_.find(file);
    if (open == nullptr) {
        return kInvalidHandle;
    }
    const std::string_view taken = data.substr(0, room);
    (*open)->content += taken;
    room -= taken.size();
    written = static_cast<std::uint32_t>(taken.size());
    return taken.size() == data.size() ? kSuccess : kDiskFull;
}

Status MemoryFileSystem::closeFile(FileHandle file) {
    return open_.close(file) ? kSuccess : kInvalidHandle;
}

Status MemoryFileSystem::writeFile(std::string_view path, std::string_view content, bool replace) {
    if (const auto found = files_.find(keyOf(path)); found != files_.end()) {
        if (found->second->isFolder || !replace) {
            return found->second->isFolder ? kBadPathname : kFileExists;
        }
    }
    if (content.size() > room) {
        return kDiskFull;
    }
    OwnedFile file(*this);
    const Status status = openForAppend(path, file.receive());
    if (status == kSuccess) {
        (*open_.find(file.get()))->content = content;
        room -= content.size();
    }
    return status == kFileNotFound ? kBadPathname : status;
}

Status MemoryFileSystem::listFiles(std::string_view folder, std::vector<std::string>& names) {
    const std::string key = keyOf(folder);
    if (!files_.contains(key)) {
        return kFileNotFound;
    }
    names.clear();
    for (const auto& [path, file] : files_) {
        if (!file->isFolder && path.substr(0, path.find_last_of('\\')) == key) {
            names.push_back(file->name);
        }
    }
    std::sort(names.begin(), names.end());
    return kSuccess;
}

void MemoryFileSystem::add(std::string_view path, std::string_view content) {
    bool isFolder = false;
    for (std::string key = keyOf(path); !key.empty(); isFolder = true) {
        auto& file = files_[key];
        if (file == nullptr) {
            file = std::make_shared<File>(File{std::string(path.substr(path.find_last_of("\\/") + 1)), {}, isFolder});
        }
        file->content += content;
        content = {};
        path = path.substr(0, path.find_last_of("\\/"));
        const std::size_t above = key.find_last_of('\\');
        key.resize(above == std::string::npos ? 0 : above);
    }
}

void MemoryFileSystem::remove(std::string_view path) {
    files_.erase(keyOf(path));
}

std::string MemoryFileSystem::content(std::string_view path) {
    std::string text;
    readFile(path, text);
    return text;
}

}  // namespace kz7
