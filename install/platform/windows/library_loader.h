// Libraries as Windows loads them.
#pragma once

#include "install/platform/library_loader.h"

namespace kz7 {

class WindowsLibraryLoader final : public ILibraryLoader {
public:
    Status load(std::string_view path, LibraryHandle& library) override;
    Status resolve(LibraryHandle library, std::string_view name, LibraryFunction& function) override;
    Status free(LibraryHandle library) override;
};

}  // namespace kz7
