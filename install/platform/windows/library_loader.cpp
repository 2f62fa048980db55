#include "install/platform/windows/ports.h"

#include <windows.h>

#include <bit>
#include <string>

#include "install/platform/windows/paths.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

HMODULE moduleOf(LibraryHandle library) {
    return std::bit_cast<HMODULE>(library);
}

// Some systems set no error for a missing export.
Status lastErrorOr(Status fallback) {
    const Status status = GetLastError();
    return status == kSuccess ? fallback : status;
}

class WindowsLibraryLoader final : public ILibraryLoader {
public:
    Status load(std::string_view path, LibraryHandle& library) override {
        if (!isAbsolutePath(path)) {
            return kModuleNotFound;
        }
        const HMODULE module = LoadLibraryExW(WideText(path).c_str(), nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
        if (module == nullptr) {
            return kModuleNotFound;
        }
        library = std::bit_cast<LibraryHandle>(module);
        return kSuccess;
    }

    Status resolve(LibraryHandle library, std::string_view name, LibraryFunction& function) override {
        SetLastError(kSuccess);
        const FARPROC entry = GetProcAddress(moduleOf(library), std::string(name).c_str());
        if (entry == nullptr) {
            return lastErrorOr(kProcedureNotFound);
        }
        function = std::bit_cast<LibraryFunction>(entry);
        return kSuccess;
    }

    Status free(LibraryHandle library) override {
        return FreeLibrary(moduleOf(library)) != 0 ? kSuccess : lastErrorOr(kInvalidHandle);
    }
};

}  // namespace

std::unique_ptr<ILibraryLoader> windowsLibraries() {
    return std::make_unique<WindowsLibraryLoader>();
}

}  // namespace kz7
