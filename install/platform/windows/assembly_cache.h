// The assembly cache of every .NET framework generation on this machine, through the framework's own
// interface. A framework that is not installed has no cache: nothing to deregister, and no room to register.
#pragma once

#include "install/platform/assembly_cache.h"

namespace kz7 {

class WindowsAssemblyCache final : public IAssemblyCache {
public:
    Status deregisterProviders(std::string_view level) override;
    Status registerProviders(std::string_view location, std::string_view level,
                             FrameworkGenerations generations) override;
};

}  // namespace kz7
