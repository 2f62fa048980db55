// The file-system port on POSIX: product paths are led into the state directory.
#pragma once

#include <string>

#include "install/platform/embedded/descriptor_table.h"
#include "install/platform/file_system.h"

namespace kz7 {

class EmbeddedFileSystem final : public IFileSystem {
public:
    explicit EmbeddedFileSystem(std::string stateDirectory);

    Status probe(std::string_view path) override;
    Status readFile(std::string_view path, std::string& content) override;
    Status openForAppend(std::string_view path, FileHandle& file) override;
    Status write(FileHandle file, std::string_view data, std::uint32_t& written) override;
    Status closeFile(FileHandle file) override;
    Status findFile(std::string_view pattern, std::string& name) override;
    Status productPath(std::string_view hostPath, std::string& path) override;
    std::string shownPath(std::string_view path) override;

private:
    std::string stateDirectory_;
    DescriptorTable<FileHandle> files_;
};

}  // namespace kz7
