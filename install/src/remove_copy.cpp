#include "install/src/remove_copy.h"

#include "install/src/copies/copy_list.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/copy_name.h"
#include "install/src/registry/registry_access.h"
#include "install/src/services/management_service.h"

namespace kz7 {
namespace {

// clang-format off
constexpr std::string_view kNotFound = "The KZ7 Copy %s was not found\n";
// Deliberate: no line feed; installers compare the output to its end.
constexpr std::string_view kRemoved  = "The KZ7 Copy %s has been removed";
// clang-format on

}  // namespace

Status removeCopy(IRegistryStore& registry, IServiceManager& services, IDebugOutput& debug, Report& report,
                  const char* copyName, bool keepsProduct) {
    InstallCopyList copies(registry, debug, false, false);
    if (copies.findByName(copyName) == nullptr) {
        // A store that cannot be read does not tell whether the copy exists.
        if (const Status readable = registry.commit(); !succeeded(readable)) {
            return readable;
        }
        report.line(kNotFound, {std::string_view(copyName)});
        return kMissingItem;
    }
    const bool hasOthers = copies.status() == 0 && copies.count() > 1;
    if (keepsProduct && !hasOthers) {
        return kReadFault;
    }
    // Deliberate: if the list could not be read completely, the whole product is deleted, as for the last copy. The
    // copy's 32-bit key and the values that name it remain.
    if (hasOthers) {
        deleteTree(registry, KeyHandle::localMachine, layout::kCopy, 0, copyName, {});
        const std::string copy = substituteCopyName(layout::kCopy, copyName);
        if (succeeded(checkPathLength(copy))) {
            registry.deleteKey(KeyHandle::localMachine, copy, 0);
        }
    } else {
        deleteTree(registry, KeyHandle::localMachine, layout::kProduct, 0, {}, {});
    }
    deleteServiceByName(services, managementServiceName(copyName).view());
    if (const Status committed = registry.commit(); !succeeded(committed)) {
        return committed;
    }
    report.line(kRemoved, {std::string_view(copyName)});
    return kSuccess;
}

}  // namespace kz7
