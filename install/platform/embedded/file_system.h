// The file-system port on POSIX: product paths are led into the state directory.
#pragma once

#include <string>

#include "install/platform/file_system.h"

namespace kz7 {

class EmbeddedFileSystem final : public IFileSystem {
public:
    explicit EmbeddedFileSystem(std::string stateDirectory);

    Status probe(std::string_view path) override;

private:
    std::string stateDirectory_;
};

}  // namespace kz7
