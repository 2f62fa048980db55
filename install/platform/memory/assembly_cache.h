// The assembly cache for tests and previews: the records that a host without the framework keeps, of the
// provider files it is told of.
#pragma once

#include <string>
#include <vector>

#include "install/platform/assembly_records.h"

namespace kz7 {

class MemoryAssemblyCache final : public IAssemblyCache {
public:
    explicit MemoryAssemblyCache(IRegistryStore& registry) : registry_(registry) {}

    Status deregisterProviders(std::string_view level) override { return dropProviders(registry_, level); }
    Status registerProviders(std::string_view location, std::string_view level,
                             FrameworkGenerations generations) override {
        return recordProviders(registry_, location, level, generations, files);
    }

    std::vector<std::string> files;  // the provider files of every location

private:
    IRegistryStore& registry_;
};

}  // namespace kz7
