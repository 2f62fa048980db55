// Turns a version-8 registry into the layout of side-by-side copies: the old tree backed up and cleared, its
// profiles carried over into the copy "kz7build", that copy added, its service registered.
#pragma once

#include <functional>
#include <string_view>

#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/src/add_copy.h"
#include "install/src/registry/report.h"

namespace kz7 {

// Registers the data providers of a location; ends every migration and gives its result.
using ProviderRegistration = std::function<Status(std::string_view location)>;

// A registry that is version 9 already is refreshed, not migrated. The migration's own failures are reported
// and never reach the result.
Status migrateToVersion9(IRegistryStore& registry, IServiceManager& services, Report& report, const LevelQuery& level,
                         const ProviderRegistration& registerProviders, std::string_view location);

}  // namespace kz7
