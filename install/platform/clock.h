// The clock port: the local time, as text.
#pragma once

#include <ctime>

#include "install/platform/buffer.h"
#include "install/platform/status.h"

namespace kz7 {

// The texts of a time that are asked for.
enum class TimeText {
    dateAndZone,  // "%c %Z" of the C library's strftime()
    timeOfDay,    // "%H:%M:%S"
};

class IClock {
public:
    virtual ~IClock() = default;

    // The time now, without a NUL. kMoreData: it does not fit with one.
    virtual Status localTime(TimeText form, Buffer& text) = 0;
};

// That time in that form, for the implementations. kMoreData as above.
Status giveTime(const std::tm& time, TimeText form, Buffer& text);

}  // namespace kz7
