// The clock port on the C library.
#pragma once

#include "install/platform/clock.h"

namespace kz7 {

class EmbeddedClock final : public IClock {
public:
    Status localTime(TimeText form, Buffer& text) override;
};

}  // namespace kz7
