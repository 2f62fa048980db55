// What this machine runs, as the system itself says.
#pragma once

#include "install/platform/host_identity.h"

namespace kz7 {

class WindowsHostIdentity final : public IHostIdentity {
public:
    Status operatingSystem(std::string& name, std::string& version) override;
};

}  // namespace kz7
