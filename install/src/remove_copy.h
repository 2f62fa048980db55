// Removes one installed copy: its tree in the native view, or the whole product tree with the last one, and
// its management service.
#pragma once

#include "install/platform/debug_output.h"
#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/src/registry/report.h"

namespace kz7 {

// 0, or kMissingItem when no copy has that name. What the deletions give does not change it, only a store
// that could not keep them does.
Status removeCopy(IRegistryStore& registry, IServiceManager& services, IDebugOutput& debug, Report& report,
                  const char* copyName);

}  // namespace kz7
