// A machine that runs what a test says.
#pragma once

#include "install/platform/host_identity.h"

namespace kz7 {

class MemoryHostIdentity final : public IHostIdentity {
public:
    Status operatingSystem(std::string& name, std::string& version) override {
        name = systemName;
        version = systemVersion;
        return kSuccess;
    }

    std::string systemName = "Memory";
    std::string systemVersion = "1.0";
};

}  // namespace kz7
