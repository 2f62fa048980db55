// The assembly cache of a host without the framework: the provider files that lie in a location's bin folder,
// as records in the registry store.
#pragma once

#include <string>

#include "install/platform/assembly_cache.h"
#include "install/platform/registry_store.h"

namespace kz7 {

class EmbeddedAssemblyCache final : public IAssemblyCache {
public:
    EmbeddedAssemblyCache(IRegistryStore& registry, std::string stateDirectory);

    Status deregisterProviders(std::string_view level) override;
    Status registerProviders(std::string_view location, std::string_view level,
                             FrameworkGenerations generations) override;

private:
    IRegistryStore& registry_;
    std::string stateDirectory_;
};

}  // namespace kz7
