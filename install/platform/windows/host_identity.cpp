#include "install/platform/windows/host_information.h"

#include <windows.h>
#include <winternl.h>

namespace kz7 {

Status WindowsHost::operatingSystem(OperatingSystem& system) {
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

}  // namespace kz7
