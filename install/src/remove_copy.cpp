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

void deleteCopy(IRegistryStore& registry, IServiceManager& services, std::string_view copyName, bool isLast) {
    if (isLast) {
        deleteTree(registry, KeyHandle::localMachine, layout::kProduct, 0, {}, {});
    } else {
        // Deliberate: the copy's 32-bit key and the values that name it remain.
        deleteTree(registry, KeyHandle::localMachine, layout::kCopy, 0, copyName, {});
        const std::string copy = substituteCopyName(layout::kCopy, copyName);
        if (succeeded(checkPathLength(copy))) {
            registry.deleteKey(KeyHandle::localMachine, copy, 0);
        }
    }
    deleteServiceByName(services, managementServiceName(copyName).view());
}

Status removeCopy(IRegistryStore& registry, IServiceManager& services, IDebugOutput& debug, Report& report,
                  const char* copyName) {
    InstallCopyList copies(registry, debug, false, false);
    if (copies.findByName(copyName) == nullptr) {
        // A store that cannot be read does not tell whether the copy exists.
        if (const Status readable = registry.commit(); !succeeded(readable)) {
            return readable;
        }
        report.line(kNotFound, {std::string_view(copyName)});
        return kMissingItem;
    }
    // Deliberate: if the list could not be read completely, the whole product is deleted, as for the last copy.
    deleteCopy(registry, services, copyName, copies.status() != 0 || copies.count() <= 1);
    if (const Status committed = registry.commit(); !succeeded(committed)) {
        return committed;
    }
    report.line(kRemoved, {std::string_view(copyName)});
    return kSuccess;
}

}  // namespace kz7
