// The assembly cache of a host without the framework: records in the registry store, one value per provider
// file, level and generation, written in the store's own transaction.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "install/platform/assembly_cache.h"
#include "install/platform/registry_store.h"

namespace kz7 {

// The key of the records, below HKEY_LOCAL_MACHINE.
inline constexpr std::string_view kAssemblyRecords = "SOFTWARE\\Classes\\Installer\\Assemblies\\Global";

// Whether a file of a bin folder is a data provider.
bool isProviderFile(std::string_view file);

// Records every file for every generation in `generations`; the data is the path of the file. Without files the key is
// not created either.
Status recordProviders(IRegistryStore& registry, std::string_view location, std::string_view level,
                       FrameworkGenerations generations, const std::vector<std::string>& files);

// Deletes the records of that level. Succeeds if no record has that level and if the level is empty.
Status dropProviders(IRegistryStore& registry, std::string_view level);

}  // namespace kz7
