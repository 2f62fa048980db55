#include "install/platform/windows/host_information.h"

#include <ctime>

#include "install/platform/encoding.h"
#include "install/platform/registry_path.h"

namespace kz7 {

Status WindowsHost::localTime(TimeText form, Buffer& text) {
    const std::time_t now = std::time(nullptr);
    std::tm parts{};
    if (localtime_s(&parts, &now) != 0) {
        return kGeneralFailure;
    }
    char room[256];
    Buffer narrow(room, sizeof room);
    const Status status = giveTime(parts, form, narrow);
    // The time zone has a name in the language of the machine.
    return status == kSuccess ? giveName(textFromNarrow(narrow.view()), text) : status;
}

}  // namespace kz7
