// The assembly cache of a host without the framework: records in any registry store, one value per provider file, level
// and generation.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "install/platform/assembly_cache.h"
#include "install/platform/file_system.h"
#include "install/platform/registry_store.h"

namespace kz7 {

// The key of the records, below HKEY_LOCAL_MACHINE.
inline constexpr std::string_view kAssemblyRecords = "SOFTWARE\\Classes\\Installer\\Assemblies\\Global";

// The names of the data providers in a location's bin folder; `folder` is its path with a separator at the end. Empty
// for a folder that is missing or cannot be read.
std::vector<std::string> providerFiles(IFileSystem& files, std::string_view location, std::string& folder);

class AssemblyRecords final : public IAssemblyCache {
public:
    // Writes through the registry, in its transaction.
    AssemblyRecords(IRegistryStore& registry, IFileSystem& files) : registry_(registry), files_(files) {}

    Status deregisterProviders(std::string_view level) override;
    Status registerProviders(std::string_view location, std::string_view level,
                             FrameworkGenerations generations) override;

private:
    IRegistryStore& registry_;
    IFileSystem& files_;
};

}  // namespace kz7
