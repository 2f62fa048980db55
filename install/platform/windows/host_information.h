// The host port on Windows.
#pragma once

#include "install/platform/host_information.h"

namespace kz7 {

class WindowsHost final : public IHostInformation {
public:
    Status localTime(TimeText form, Buffer& text) override;
    Status operatingSystem(OperatingSystem& system) override;
};

}  // namespace kz7
