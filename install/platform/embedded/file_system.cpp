#include "install/platform/embedded/file_system.h"

#include <unistd.h>

#include <cerrno>

#include "install/platform/embedded/paths.h"

namespace kz7 {

EmbeddedFileSystem::EmbeddedFileSystem(std::string stateDirectory) : stateDirectory_(std::move(stateDirectory)) {}

Status EmbeddedFileSystem::probe(std::string_view path) {
    const std::string host = hostPath(path, stateDirectory_);
    if (host.empty()) {
        return kFileNotFound;
    }
    if (access(host.c_str(), F_OK) == 0) {
        return kSuccess;
    }
    return errno == EACCES ? kAccessDenied : kFileNotFound;
}

}  // namespace kz7
