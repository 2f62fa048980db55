#include "install/platform/windows/host_information.h"

#include <windows.h>
#include <winternl.h>

namespace kz7 {

Status WindowsHost::operatingSystem(std::string& name, std::string& version) {
    // The documented calls answer the version that the program says it was made for.
    using GetVersionCall = LONG(WINAPI*)(RTL_OSVERSIONINFOW*);
    const HMODULE system = GetModuleHandleA("ntdll.dll");
    const auto getVersion =
        reinterpret_cast<GetVersionCall>(reinterpret_cast<void*>(GetProcAddress(system, "RtlGetVersion")));
    RTL_OSVERSIONINFOW information{};
    information.dwOSVersionInfoSize = sizeof information;
    if (getVersion == nullptr || getVersion(&information) != 0) {
        return kGeneralFailure;
    }
    name = "Windows";
    version = std::to_string(information.dwMajorVersion) + '.' + std::to_string(information.dwMinorVersion) + '.' +
              std::to_string(information.dwBuildNumber);
    return kSuccess;
}

}  // namespace kz7
