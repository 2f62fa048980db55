// Puts the registry back into the version-8 layout: the backup of a migration restored, the version-8
// defaults written, the management service of that layout switched off.
#pragma once

#include <string_view>

#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/src/registry/report.h"

namespace kz7 {

// `location` is the version-8 product directory. Returns the status of the last default written, or that of a
// store that could not keep the changes.
Status restoreVersion8(IRegistryStore& registry, IServiceManager& services, Report& report, std::string_view location);

}  // namespace kz7
