#include "install/platform/windows/ports.h"

#include <windows.h>
#include <winternl.h>

#include <ctime>

#include "install/platform/registry_path.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

class WindowsHost final : public IHostInformation {
public:
    Status localTime(TimeText form, Buffer& text) override {
        const std::time_t now = std::time(nullptr);
        std::tm parts{};
        if (localtime_s(&parts, &now) != 0) {
            return kGeneralFailure;
        }
        char room[256];
        Buffer narrow(room, sizeof room);
        const Status status = giveTime(parts, form, narrow);
        // The name of the time zone is in the language of the machine.
        return status == kSuccess ? giveName(textFromNarrow(narrow.view()), text) : status;
    }

    Status operatingSystem(OperatingSystem& system) override {
        // The documented calls return the version that the program claims to support in its manifest.
        using GetVersionCall = LONG(WINAPI*)(RTL_OSVERSIONINFOW*);
        const HMODULE library = GetModuleHandleA("ntdll.dll");
        const auto getVersion =
            reinterpret_cast<GetVersionCall>(reinterpret_cast<void*>(GetProcAddress(library, "RtlGetVersion")));
        RTL_OSVERSIONINFOW information{};
        information.dwOSVersionInfoSize = sizeof information;
        if (getVersion == nullptr || getVersion(&information) != 0) {
            return kGeneralFailure;
        }
        system = {"Windows", std::to_string(information.dwMajorVersion),
                  std::to_string(information.dwMinorVersion) + '.' + std::to_string(information.dwBuildNumber)};
        return kSuccess;
    }
};

}  // namespace

std::string environmentText(const char* name) {
    const WideText wide(name);
    return textOf([&](wchar_t* room, DWORD size) { return GetEnvironmentVariableW(wide.c_str(), room, size); });
}

std::unique_ptr<IHostInformation> windowsHost() {
    return std::make_unique<WindowsHost>();
}

}  // namespace kz7
