// The file-system port on Windows.
#pragma once

#include "install/platform/file_system.h"

namespace kz7 {

class WindowsFileSystem final : public IFileSystem {
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
};

}  // namespace kz7
