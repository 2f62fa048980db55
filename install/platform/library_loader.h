// The library port: loads a product library by its path and finds its entry points.
#pragma once

#include <cstdint>
#include <string_view>

#include "install/platform/owned_handle.h"
#include "install/platform/status.h"

namespace kz7 {

enum class LibraryHandle : std::uint64_t { none = 0 };

// An entry point of any signature; the caller casts it to the one it expects.
using LibraryFunction = void (*)();

// Outputs are written on success only. One thread.
class ILibraryLoader {
public:
    virtual ~ILibraryLoader() = default;

    // Loads the library and its dependencies, from the library's own folder first. Only an absolute path names a
    // library: the tool runs with all rights and must load nothing from the current directory.
    // kModuleNotFound: no library, or one that the host cannot load. The caller frees `library`.
    virtual Status load(std::string_view path, LibraryHandle& library) = 0;

    // kProcedureNotFound: the library has no such entry point. `function` is valid until the library is freed.
    virtual Status resolve(LibraryHandle library, std::string_view name, LibraryFunction& function) = 0;

    virtual Status free(LibraryHandle library) = 0;
};

using OwnedLibrary = OwnedHandle<PortTraits<ILibraryLoader, LibraryHandle, &ILibraryLoader::free>>;

}  // namespace kz7
