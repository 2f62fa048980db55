#include "install/platform/embedded/host_identity.h"

#include <sys/utsname.h>

namespace kz7 {

Status EmbeddedHostIdentity::operatingSystem(std::string& name, std::string& version) {
    utsname system{};
    if (uname(&system) == -1) {
        return kGeneralFailure;
    }
    name = system.sysname;
    version = system.release;
    return kSuccess;
}

}  // namespace kz7
