// The management service of a copy and its event-log source.
#pragma once

#include <string_view>

#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/platform/text.h"
#include "install/src/registry/report.h"

namespace kz7 {

using ServiceName = FixedText<1024>;

ServiceName managementServiceName(std::string_view copyName);

// The path of the service's program in a location, as the service gets it.
FixedText<261> managementServiceProgram(std::string_view location);

// Creates the copy's service and the event-log source, and with `start` starts the service. Succeeds at once if the
// service exists. Every failure is reported once and returned.
Status registerManagementService(IRegistryStore& registry, IServiceManager& services, Report& report,
                                 std::string_view location, std::string_view copyName, bool start);

// Sets a service to start on demand only and stops it. Failures are reported.
void switchOffService(IServiceManager& services, Report& report, std::string_view name);

// Stops a service that runs and deletes it; succeeds if the service does not exist.
Status deleteServiceByName(IServiceManager& services, std::string_view name);

}  // namespace kz7
