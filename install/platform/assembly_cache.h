// The assembly-cache port: the .NET framework's machine-wide cache, where the data providers of a copy are
// placed for every program to find.
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

    // Takes the providers of that level out of the cache of every generation. None there, and the empty
    // level, are success.
    virtual Status deregisterProviders(std::string_view level) = 0;

    // Places the location's providers in the caches asked for; `level` is what they are kept under where the
    // files do not say it themselves. None to register is success. Any other status: not all of them were
    // registered in all generations, for want of the framework as a rule; those that could be, are.
    virtual Status registerProviders(std::string_view location, std::string_view level,
                                     FrameworkGenerations generations) = 0;
};

}  // namespace kz7
