#include "install/platform/embedded/clock.h"

#include <ctime>

namespace kz7 {

Status EmbeddedClock::localTime(TimeText form, Buffer& text) {
    const std::time_t now = std::time(nullptr);
    std::tm parts{};
    if (localtime_r(&now, &parts) == nullptr) {
        return kGeneralFailure;
    }
    return giveTime(parts, form, text);
}

}  // namespace kz7
