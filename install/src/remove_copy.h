// Removes one installed copy: its tree in the native view, or the whole product tree with the last copy, and its
// management service.
#pragma once

#include "install/platform/console.h"
#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/src/registry/report.h"

namespace kz7 {

// 0, or kMissingItem if no copy has that name. The results of the deletions do not change it; a failed commit does.
Status removeCopy(IRegistryStore& registry, IServiceManager& services, IDebugOutput& debug, Report& report,
                  const char* copyName);

// Deletes the keys and the service of a copy that is known to be installed, or with `isLast` the whole product tree and
// the service. Without a commit; failures are not reported.
void deleteCopy(IRegistryStore& registry, IServiceManager& services, std::string_view copyName, bool isLast);

}  // namespace kz7
