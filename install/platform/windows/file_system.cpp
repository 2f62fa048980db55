#include "install/platform/windows/file_system.h"

#include <windows.h>

#include <string>

namespace kz7 {

Status WindowsFileSystem::probe(std::string_view path) {
    // Only a path from a root names something: nothing is taken relative to the current folder.
    const bool fromRoot = path.substr(0, 1) == "\\" || path.substr(0, 1) == "/" || path.substr(1, 1) == ":";
    if (!fromRoot) {
        return kFileNotFound;
    }
    if (GetFileAttributesA(std::string(path).c_str()) != INVALID_FILE_ATTRIBUTES) {
        return kSuccess;
    }
    const Status status = GetLastError();
    return status == ERROR_ACCESS_DENIED ? kAccessDenied : kFileNotFound;
}

}  // namespace kz7
