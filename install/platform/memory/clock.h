// The clock port in memory: a clock that stands still.
#pragma once

#include <string>

#include "install/platform/clock.h"
#include "install/platform/registry_path.h"

namespace kz7 {

class MemoryClock final : public IClock {
public:
    Status localTime(TimeText form, Buffer& text) override {
        return giveName(form == TimeText::timeOfDay ? timeOfDay : dateAndZone, text);
    }

    std::string dateAndZone = "Tue Jan  2 03:04:05 2024 UTC";
    std::string timeOfDay = "03:04:05";
};

}  // namespace kz7
