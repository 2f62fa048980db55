// The host port: the local time as text, and the name and version of the operating system.
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

// What "uname", "uname -v" and "uname -r" print on a POSIX host, each on one line. Version and release together are the
// version number on Windows: "10" and "0.19045".
struct OperatingSystem {
    std::string name;
    std::string version;
    std::string release;
};

class IHostInformation {
public:
    virtual ~IHostInformation() = default;

    // The time now, without a NUL. kMoreData: the text and a NUL do not fit.
    virtual Status localTime(TimeText form, Buffer& text) = 0;

    // Starts no program. `system` is written on success only.
    virtual Status operatingSystem(OperatingSystem& system) = 0;
};

// A variable of this process's environment; empty if it is not set.
std::string environmentText(const char* name);

// Formats a time, for the implementations. kMoreData as above.
Status giveTime(const std::tm& time, TimeText form, Buffer& text);

}  // namespace kz7
