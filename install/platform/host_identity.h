// The port that says what this machine runs.
#pragma once

#include <string>

#include "install/platform/status.h"

namespace kz7 {

class IHostIdentity {
public:
    virtual ~IHostIdentity() = default;

    // The operating system's own name and version, on one line each.
    virtual Status operatingSystem(std::string& name, std::string& version) = 0;
};

}  // namespace kz7
