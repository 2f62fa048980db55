#include "install/platform/windows/clock.h"

#include <ctime>

namespace kz7 {

Status WindowsClock::localTime(TimeText form, Buffer& text) {
    const std::time_t now = std::time(nullptr);
    std::tm parts{};
    if (localtime_s(&parts, &now) != 0) {
        return kGeneralFailure;
    }
    return giveTime(parts, form, text);
}

}  // namespace kz7
