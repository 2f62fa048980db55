#include "install/platform/host_information.h"

namespace kz7 {

Status giveTime(const std::tm& time, TimeText form, Buffer& text) {
    const std::size_t length = form == TimeText::timeOfDay ? std::strftime(text.data, text.capacity, "%H:%M:%S", &time)
                                                           : std::strftime(text.data, text.capacity, "%c %Z", &time);
    if (length == 0) {
        return kMoreData;
    }
    text.size = static_cast<std::uint32_t>(length);
    return kSuccess;
}

}  // namespace kz7
