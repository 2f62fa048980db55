// The file-system port in memory: the paths that exist and the content of files.
#pragma once

#include <limits>
#include <map>
#include <memory>
#include <string>

#include "install/platform/file_system.h"
#include "install/platform/handle_table.h"

namespace kz7 {

class MemoryFileSystem final : public IFileSystem {
public:
    Status probe(std::string_view path) override;
    Status readFile(std::string_view path, std::string& content) override;
    Status openForAppend(std::string_view path, FileHandle& file) override;
    Status write(FileHandle file, std::string_view data, std::uint32_t& written) override;
    Status closeFile(FileHandle file) override;
    Status writeFile(std::string_view path, std::string_view content, bool replace) override;
    Status listFiles(std::string_view folder, std::vector<std::string>& names) override;
    Status productPath(std::string_view hostPath, std::string& path) override;
    std::string shownPath(std::string_view path) override { return std::string(path); }

    // Creates a file and the folders above it. The path is absolute; names compare without case, as on the product's
    // drives.
    void add(std::string_view path, std::string_view content = {});

    void remove(std::string_view path);

    // The content of a file; empty if the file does not exist.
    std::string content(std::string_view path);

    std::size_t openFiles() const { return open_.size(); }

    std::uint64_t room = std::numeric_limits<std::uint64_t>::max();  // bytes that can still be written

private:
    struct File {
        std::string name;  // in its first spelling
        std::string content;
        bool isFolder = false;
    };

    std::map<std::string, std::shared_ptr<File>> files_;  // and folders, by folded path
    HandleTable<FileHandle, std::shared_ptr<File>> open_;
};

}  // namespace kz7
