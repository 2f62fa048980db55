#include <windows.h>

#include "tests/support/backends.h"

namespace kz7::test {

const std::size_t kFloodMebibytes = 10;
const bool kExitCodesAreWhole = true;

std::string childProgram() {
    char path[MAX_PATH] = {};
    GetModuleFileNameA(nullptr, path, MAX_PATH);
    return std::filesystem::path(path).replace_filename("kz7_child.exe").string();
}

HostPorts hostPorts(const std::string& place) {
    const HMODULE system = GetModuleHandleA("ntdll.dll");
    const bool wine = system != nullptr && GetProcAddress(system, "wine_get_version") != nullptr;
    return {hostPlatform({.program = "test"}),
            place,
            place,
            std::filesystem::path(childProgram()).replace_filename("kz7_test_service.exe"),
            {.ordersValuesByName = wine,
             .ordersKeysByLowerCase = wine,
             .foldsBeyondAscii = true,
             .passesClassesOn = wine,
             .startsDeletedServices = wine,
             .needsFramework = true,
             .usesHandlesAgain = true}};
}

void setSearchPath(const std::string& path) {
    _putenv_s("PATH", path.c_str());
}

}  // namespace kz7::test
