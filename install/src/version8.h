// Returns the registry to the version-8 layout: restores the backup of a migration, writes the version-8 defaults and
// switches the management service of that layout off.
#pragma once

#include <string_view>

#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/src/registry/report.h"

namespace kz7 {

// `location` is the version-8 product directory. Returns the status of the last default that was written, or of a
// failed commit.
Status restoreVersion8(IRegistryStore& registry, IServiceManager& services, Report& report, std::string_view location);

}  // namespace kz7
