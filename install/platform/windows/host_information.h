// The host port on Windows.
#pragma once

#include "install/platform/host_information.h"

namespace kz7 {

class WindowsHost final : public IHostInformation {
public:
    Status localTime(TimeText form, Buffer& text) override;
    Status operatingSystem(std::string& name, std::string& version) override;
};

}  // namespace kz7
