// Migrates a version-8 registry to the layout of side-by-side copies: takes a backup of the old tree and clears it,
// copies its profiles to the copy "kz7build", adds that copy and registers its service.
#pragma once

#include <functional>
#include <string_view>

#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/src/add_copy.h"
#include "install/src/registry/report.h"

namespace kz7 {

// Registers the data providers of a location; the last step of every migration, whose result it returns.
using ProviderRegistration = std::function<Status(std::string_view location)>;

// A version-9 registry is refreshed, not migrated. Failures of the migration itself are reported and do not change the
// result.
Status migrateToVersion9(IRegistryStore& registry, IServiceManager& services, Report& report, const LevelQuery& level,
                         const ProviderRegistration& registerProviders, std::string_view location);

}  // namespace kz7
