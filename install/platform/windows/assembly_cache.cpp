#include "install/platform/windows/ports.h"

#include <windows.h>

#include <fusion.h>

#include <bit>
#include <cwchar>
#include <memory>
#include <string>
#include <vector>

#include "install/platform/assembly_records.h"
#include "install/platform/windows/native_handle.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

struct Generation {
    FrameworkGenerations bit;
    const char* folder;
};
constexpr Generation kGenerations[] = {{kFramework2, "v2.0.50727"}, {kFramework4, "v4.0.30319"}};

constexpr wchar_t kProviderPrefix[] = L"kz7nmp";
constexpr DWORD kFullName = 0x1 | 0x2 | 0x4 | 0x20;  // version, culture, public key token, processor

struct Release {
    void operator()(IUnknown* object) const { object->Release(); }
};
template <typename Interface>
using ComPointer = std::unique_ptr<Interface, Release>;

Status statusOf(HRESULT result) {
    if (SUCCEEDED(result)) {
        return kSuccess;
    }
    return static_cast<Status>(HRESULT_FACILITY(result) == FACILITY_WIN32 ? HRESULT_CODE(result) : result);
}

class Apartment {
public:
    Apartment() : entered_(SUCCEEDED(CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED))) {}
    Apartment(const Apartment&) = delete;
    Apartment& operator=(const Apartment&) = delete;
    ~Apartment() {
        if (entered_) {
            CoUninitialize();
        }
    }

private:
    bool entered_;
};

// The library of one framework generation.
class Fusion {
public:
    explicit Fusion(const Generation& generation) {
        const std::string windows =
            textOf([](wchar_t* room, DWORD size) { return GetSystemWindowsDirectoryW(room, size); });
        if (windows.empty()) {
            return;
        }
        const std::string path = windows + "\\Microsoft.NET\\Framework64\\" + generation.folder + "\\fusion.dll";
        library_.reset(LoadLibraryExW(WideText(path).c_str(), nullptr, LOAD_WITH_ALTERED_SEARCH_PATH));
    }

    explicit operator bool() const { return library_ != nullptr; }

    Status openCache(ComPointer<::IAssemblyCache>& cache) const {
        using Create = HRESULT(STDMETHODCALLTYPE*)(::IAssemblyCache**, DWORD);
        ::IAssemblyCache* made = nullptr;
        const Status status = call<Create>("CreateAssemblyCache", &made, DWORD{0});
        cache.reset(made);
        return status;
    }

    Status openList(ComPointer<IAssemblyEnum>& list) const {
        using Create = HRESULT(STDMETHODCALLTYPE*)(IAssemblyEnum**, IUnknown*, IAssemblyName*, DWORD, LPVOID);
        IAssemblyEnum* made = nullptr;
        const Status status =
            call<Create>("CreateAssemblyEnum", &made, nullptr, nullptr, DWORD{ASM_CACHE_GAC}, nullptr);
        list.reset(made);
        return status;
    }

private:
    template <typename Function, typename... Arguments>
    Status call(const char* name, Arguments... arguments) const {
        const FARPROC entry = GetProcAddress(library_.get(), name);
        return entry == nullptr ? kProcedureNotFound : statusOf(std::bit_cast<Function>(entry)(arguments...));
    }

    NativeLibrary library_;
};

// Whether a cached assembly is a provider of a level: version 9.1.0.x belongs to level 9.1.0.
bool isProvider(IAssemblyName& assembly, const std::wstring& level) {
    wchar_t name[MAX_PATH] = {};
    DWORD size = MAX_PATH;
    DWORD high = 0;
    DWORD low = 0;
    if (FAILED(assembly.GetName(&size, name)) || FAILED(assembly.GetVersion(&high, &low)) ||
        _wcsnicmp(name, kProviderPrefix, std::wcslen(kProviderPrefix)) != 0) {
        return false;
    }
    const std::wstring version = std::to_wstring(HIWORD(high)) + L'.' + std::to_wstring(LOWORD(high)) + L'.' +
                                 std::to_wstring(HIWORD(low)) + L'.' + std::to_wstring(LOWORD(low)) + L'.';
    return version.starts_with(level + L'.');
}

// The full names of the cached providers of that level.
Status listProviders(const Fusion& fusion, const std::wstring& level, std::vector<std::wstring>& names) {
    ComPointer<IAssemblyEnum> list;
    if (const Status status = fusion.openList(list); !succeeded(status)) {
        return status;
    }
    IAssemblyName* next = nullptr;
    while (list->GetNextAssembly(nullptr, &next, 0) == S_OK) {
        const ComPointer<IAssemblyName> assembly(next);
        wchar_t name[1024] = {};
        DWORD size = 1024;
        if (isProvider(*assembly, level) && SUCCEEDED(assembly->GetDisplayName(name, &size, kFullName))) {
            names.emplace_back(name);
        }
    }
    return kSuccess;
}

Status uninstall(::IAssemblyCache& cache, const std::wstring& name) {
    ULONG disposition = 0;
    const HRESULT result = cache.UninstallAssembly(0, name.c_str(), nullptr, &disposition);
    const bool stays = disposition == IASSEMBLYCACHE_UNINSTALL_DISPOSITION_STILL_IN_USE ||
                       disposition == IASSEMBLYCACHE_UNINSTALL_DISPOSITION_HAS_INSTALL_REFERENCES;
    return result == S_FALSE && stays ? kBusy : statusOf(result);
}

// Keeps the first failure of several steps that are all taken.
void keepFirst(Status& first, Status status) {
    if (succeeded(first)) {
        first = status;
    }
}

// Through the interface of each framework. A framework that is not installed has no cache: nothing is deregistered, and
// registering fails.
class WindowsAssemblyCache final : public IAssemblyCache {
public:
    WindowsAssemblyCache(IFileSystem& files, bool isPreview) : files_(files), isPreview_(isPreview) {}

    Status deregisterProviders(std::string_view level) override {
        if (level.empty()) {
            return kSuccess;
        }
        const Apartment apartment;
        Status result = kSuccess;
        for (const Generation& generation : kGenerations) {
            const Fusion fusion(generation);
            if (!fusion) {
                continue;
            }
            ComPointer<::IAssemblyCache> cache;
            std::vector<std::wstring> names;
            keepFirst(result, fusion.openCache(cache));
            keepFirst(result, listProviders(fusion, WideText(level).c_str(), names));
            for (const std::wstring& name : isPreview_ ? std::vector<std::wstring>{} : names) {
                keepFirst(result, cache == nullptr ? kSuccess : uninstall(*cache, name));
            }
        }
        return result;
    }

    Status registerProviders(std::string_view location, std::string_view, FrameworkGenerations generations) override {
        std::string folder;
        const std::vector<std::string> files = providerFiles(files_, location, folder);
        if (files.empty()) {
            return kSuccess;
        }
        const Apartment apartment;
        Status result = kSuccess;
        for (const Generation& generation : kGenerations) {
            if ((generations & generation.bit) == 0) {
                continue;
            }
            const Fusion fusion(generation);
            ComPointer<::IAssemblyCache> cache;
            if (const Status opened = fusion ? fusion.openCache(cache) : kModuleNotFound; !succeeded(opened)) {
                keepFirst(result, opened);
                continue;
            }
            for (const std::string& file : isPreview_ ? std::vector<std::string>{} : files) {
                keepFirst(result, statusOf(cache->InstallAssembly(0, WideText(folder + file).c_str(), nullptr)));
            }
        }
        return result;
    }

private:
    IFileSystem& files_;
    bool isPreview_;
};

}  // namespace

std::unique_ptr<IAssemblyCache> windowsAssemblies(IFileSystem& files, bool isPreview) {
    return std::make_unique<WindowsAssemblyCache>(files, isPreview);
}

}  // namespace kz7
