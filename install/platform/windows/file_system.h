// The file-system port on Windows.
#pragma once

#include "install/platform/file_system.h"

namespace kz7 {

class WindowsFileSystem final : public IFileSystem {
public:
    Status probe(std::string_view path) override;
};

}  // namespace kz7
