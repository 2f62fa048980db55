#include "install/platform/embedded/clock.h"

#include <ctime>

namespace kz7 {

Status EmbeddedClock::localTime(TimeText form, Buffer& text) {
    const std::time_t now = std::time(nullptr);
    std::tm parts{};
    if (localtime_r(&now, &parts) == nullptr) {
        return kGeneralFailure;
    }
    const std::size_t length = form == TimeText::timeOfDay ? std::strftime(text.data, text.capacity, "%H:%M:%S", &parts)
                                                           : std::strftime(text.data, text.capacity, "%c %Z", &parts);
    if (length == 0) {
        return kMoreData;
    }
    text.size = static_cast<std::uint32_t>(length);
    return kSuccess;
}

}  // namespace kz7
