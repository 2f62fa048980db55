// Adds one installed copy: its keys in both registry views and its management service.
#pragma once

#include <functional>
#include <span>
#include <string>
#include <string_view>

#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/src/registry/report.h"
#include "install/src/registry/row_writer.h"

namespace kz7 {

// Queries the product library of a location for its level, a dotted text such as "9.1.0.0"; empty if the level cannot
// be read.
using LevelQuery = std::function<std::string(std::string_view location)>;

struct CopyRequest {
    std::string_view name;
    std::string_view location;
    bool isV9 = false;  // also names the copy as the default and by its level
};

// The rows of a copy's layout, below its key in each view.
std::span<const LayoutRow> copyRows();

// Returns the status of the step that failed, which is reported; what earlier steps wrote remains. Queries the level
// only with isV9. The caller commits and then prints the closing line with reportAdded().
Status addCopy(IRegistryStore& registry, IServiceManager& services, Report& report, const LevelQuery& level,
               const CopyRequest& request);

void reportAdded(Report& report, const CopyRequest& request);

}  // namespace kz7
