// The host port: the local time as text, and which operating system this is.
#pragma once

#include <ctime>
#include <string>

#include "install/platform/buffer.h"
#include "install/platform/status.h"

namespace kz7 {

enum class TimeText {
    dateAndZone,  // "%c %Z" of the C library's strftime()
    timeOfDay,    // "%H:%M:%S"
};

class IHostInformation {
public:
    virtual ~IHostInformation() = default;

    // The time now, without a NUL. kMoreData: the text and a NUL do not fit.
    virtual Status localTime(TimeText form, Buffer& text) = 0;

    // The operating system's own name and version, on one line each.
    virtual Status operatingSystem(std::string& name, std::string& version) = 0;
};

// Formats a time, for the implementations. kMoreData as above.
Status giveTime(const std::tm& time, TimeText form, Buffer& text);

}  // namespace kz7
