// The assembly-cache port: the machine-wide cache of the .NET framework, in which every program finds the data
// providers of a copy.
#pragma once

#include <cstdint>
#include <string_view>

#include "install/platform/status.h"

namespace kz7 {

// The framework generations that providers are registered for.
using FrameworkGenerations = std::uint32_t;
inline constexpr FrameworkGenerations kFramework2 = 1;
inline constexpr FrameworkGenerations kFramework4 = 2;
inline constexpr FrameworkGenerations kFrameworkAll = kFramework2 | kFramework4;

// The providers of a copy are the files kz7nmp*.dll in the bin folder of its location. One thread.
class IAssemblyCache {
public:
    virtual ~IAssemblyCache() = default;

    // Removes the providers of that level from the cache of every generation. Succeeds if no provider has that level
    // and if the level is empty.
    virtual Status deregisterProviders(std::string_view level) = 0;

    // Adds the location's providers to the caches of `generations`, under `level` if the files do not carry one
    // themselves. Succeeds if the location has no providers. On any other status some providers are missing in some
    // generation, usually because the framework is not installed; the others are registered.
    virtual Status registerProviders(std::string_view location, std::string_view level,
                                     FrameworkGenerations generations) = 0;
};

}  // namespace kz7
