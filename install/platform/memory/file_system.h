// The file-system port in memory: the set of paths that exist, and what is written to files.
#pragma once

#include <limits>
#include <map>
#include <memory>
#include <string>

#include "install/platform/file_system.h"

namespace kz7 {

class MemoryFileSystem final : public IFileSystem {
public:
    Status probe(std::string_view path) override;
    Status readFile(std::string_view path, std::string& content) override;
    Status openForAppend(std::string_view path, FileHandle& file) override;
    Status write(FileHandle file, std::string_view data, std::uint32_t& written) override;
    Status closeFile(FileHandle file) override;
    Status writeFile(std::string_view path, std::string_view content, bool replace) override;
    Status findFile(std::string_view pattern, std::string& name) override;
    Status productPath(std::string_view hostPath, std::string& path) override;
    std::string shownPath(std::string_view path) override { return std::string(path); }

    // Lets a file be there, and the folders above it. The path is absolute; names compare without case, as
    // the product's own paths do.
    void add(std::string_view path, std::string_view content = {});

    void remove(std::string_view path);

    // What a file holds; empty for one that is not there.
    std::string content(std::string_view path);

    std::size_t openFiles() const { return open_.size(); }

    std::uint64_t room = std::numeric_limits<std::uint64_t>::max();  // bytes that can still be written

private:
    struct File {
        std::string name;  // as it was first spelled
        std::string content;
        bool isFolder = false;
    };

    std::map<std::string, std::shared_ptr<File>> files_;  // and folders, by folded path
    std::map<FileHandle, std::shared_ptr<File>> open_;
    std::uint64_t lastHandle_ = 0;
};

}  // namespace kz7
