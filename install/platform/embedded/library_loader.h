// Libraries as the dynamic linker loads them, from the path that the product's path is led to.
#pragma once

#include <string>

#include "install/platform/library_loader.h"

namespace kz7 {

class EmbeddedLibraryLoader final : public ILibraryLoader {
public:
    explicit EmbeddedLibraryLoader(std::string stateDirectory);

    Status load(std::string_view path, LibraryHandle& library) override;
    Status resolve(LibraryHandle library, std::string_view name, LibraryFunction& function) override;
    Status free(LibraryHandle library) override;

private:
    std::string stateDirectory_;
};

}  // namespace kz7
