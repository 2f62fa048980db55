#include "install/platform/embedded/library_loader.h"

#include <dlfcn.h>

#include <bit>
#include <utility>

#include "install/platform/embedded/paths.h"

namespace kz7 {

EmbeddedLibraryLoader::EmbeddedLibraryLoader(std::string stateDirectory) : stateDirectory_(std::move(stateDirectory)) {}

Status EmbeddedLibraryLoader::load(std::string_view path, LibraryHandle& library) {
    const std::string host = hostPath(path, stateDirectory_);
    // A name without a slash would be searched for by the linker's rules.
    if (host.find('/') == std::string::npos) {
        return kModuleNotFound;
    }
    void* loaded = dlopen(host.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (loaded == nullptr) {
        return kModuleNotFound;
    }
    library = std::bit_cast<LibraryHandle>(loaded);
    return kSuccess;
}

Status EmbeddedLibraryLoader::resolve(LibraryHandle library, std::string_view name, LibraryFunction& function) {
    void* entry = dlsym(std::bit_cast<void*>(library), std::string(name).c_str());
    if (entry == nullptr) {
        return kProcedureNotFound;
    }
    function = std::bit_cast<LibraryFunction>(entry);
    return kSuccess;
}

Status EmbeddedLibraryLoader::free(LibraryHandle library) {
    return dlclose(std::bit_cast<void*>(library)) == 0 ? kSuccess : kInvalidHandle;
}

}  // namespace kz7
