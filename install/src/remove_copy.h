// Removes one installed copy: its tree in the native view, or the whole product tree with the last copy, and its
// management service.
#pragma once

#include "install/platform/debug_output.h"
#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/src/registry/report.h"

namespace kz7 {

// 0; kMissingItem if no copy has that name; with `keepsProduct` kReadFault, and nothing is removed, if the list of
// copies has no other one. The results of the deletions do not change it; a failed commit does.
Status removeCopy(IRegistryStore& registry, IServiceManager& services, IDebugOutput& debug, Report& report,
                  const char* copyName, bool keepsProduct = false);

}  // namespace kz7
