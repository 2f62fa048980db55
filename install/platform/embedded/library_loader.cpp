#include "install/platform/embedded/ports.h"

#include <dlfcn.h>

#include <bit>
#include <string>
#include <utility>

#include "install/platform/embedded/paths.h"

namespace kz7 {
namespace {

// Loads libraries with the dynamic linker, from the host path of the product path.
class EmbeddedLibraryLoader final : public ILibraryLoader {
public:
    explicit EmbeddedLibraryLoader(std::string stateDirectory) : stateDirectory_(std::move(stateDirectory)) {}

    Status load(std::string_view path, LibraryHandle& library) override {
        const std::string host = hostPath(path, stateDirectory_);
        // The linker would search for a name without a slash.
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

    Status resolve(LibraryHandle library, std::string_view name, LibraryFunction& function) override {
        void* entry = dlsym(std::bit_cast<void*>(library), std::string(name).c_str());
        if (entry == nullptr) {
            return kProcedureNotFound;
        }
        function = std::bit_cast<LibraryFunction>(entry);
        return kSuccess;
    }

    Status free(LibraryHandle library) override {
        return dlclose(std::bit_cast<void*>(library)) == 0 ? kSuccess : kInvalidHandle;
    }

private:
    std::string stateDirectory_;
};

}  // namespace

std::unique_ptr<ILibraryLoader> embeddedLibraries(std::string stateDirectory) {
    return std::make_unique<EmbeddedLibraryLoader>(std::move(stateDirectory));
}

}  // namespace kz7
