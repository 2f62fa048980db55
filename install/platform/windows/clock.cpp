#include "install/platform/windows/host_information.h"

#include <ctime>

namespace kz7 {

Status WindowsHost::localTime(TimeText form, Buffer& text) {
    const std::time_t now = std::time(nullptr);
    std::tm parts{};
    if (localtime_s(&parts, &now) != 0) {
        return kGeneralFailure;
    }
    return giveTime(parts, form, text);
}

}  // namespace kz7
