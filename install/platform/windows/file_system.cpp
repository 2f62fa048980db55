#include "install/platform/windows/file_system.h"

#include <io.h>

#include <cerrno>
#include <string>

#include "install/platform/windows/paths.h"

namespace kz7 {

Status WindowsFileSystem::probe(std::string_view path) {
    // Nothing is taken relative to the current folder.
    if (!isAbsolutePath(path) || path.find('\0') != std::string_view::npos) {
        return kFileNotFound;
    }
    if (_access(std::string(path).c_str(), 0) == 0) {
        return kSuccess;
    }
    return errno == EACCES ? kAccessDenied : kFileNotFound;
}

}  // namespace kz7
