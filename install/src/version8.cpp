#include "install/src/version8.h"

#include <array>

#include "install/src/held_console.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/registry_access.h"
#include "install/src/registry/report.h"
#include "install/src/registry/row_writer.h"
#include "install/src/services/management_service.h"

namespace kz7 {
namespace {

// clang-format off
constexpr ErrorText kDefaultsFailed  {1241, "An error occurred while creating default version 8 registry keys\n"};
constexpr ErrorText kRestoreFailed   {1466, "Failed to copy copy %s to %s\n", kAlways};
constexpr ErrorText kStartEmpty      {1467, "Create empty version 8 registry\n", kAlways};
constexpr ErrorText kLocationFailed  {1486, "Failed to create basic registry keys or update location of the version 8 sqllib\n"};

constexpr std::string_view kBegin        = "Creating version 8 registry\n";
constexpr std::string_view kDefaultsSet  = "Version 8 default registry keys created successfully\n";

constexpr std::array kDefaults = {
    LayoutRow{"",                "KZ7 Path Name", kLocation},
    LayoutRow{"Components",      "BASE_CLIENT",   ""},
    LayoutRow{"CurrentVersion",  "Modification",  "3"},
    LayoutRow{"CurrentVersion",  "Release",       "2"},
    LayoutRow{"CurrentVersion",  "Version",       "8"},
    LayoutRow{"CurrentVersion",  "Service Level", "BUILD"},
    LayoutRow{"PROFILES",        "",              ""},
    LayoutRow{"GLOBAL_PROFILE",  "KZ7PATH",       kLocation},
    LayoutRow{"DAS_PROFILES",    "",              ""},
};
constexpr std::array kLastDefault = {
    LayoutRow{"InstalledCopies", "",              "KZ7V8"},
};
// clang-format on

constexpr std::string_view kService = "KZ7MGMTSVC";

void restoreBackup(IRegistryStore& registry, Report& report) {
    if (succeeded(TreeCopy(registry).copy(KeyHandle::localMachine, layout::kBackup, KeyHandle::localMachine,
                                          layout::kProduct, true))) {
        deleteTree(registry, KeyHandle::localMachine, layout::kBackup, 0, {}, {});
    } else {
        report.error(kRestoreFailed, {layout::kBackup, layout::kProduct});
        report.error(kStartEmpty);
    }
}

Status writeDefaults(IRegistryStore& registry, Report& report, std::string_view location) {
    RowWriter writer(registry, report);
    Status status = writer.writeLayout(kDefaults, layout::kProduct, {}, location);
    if (succeeded(status)) {
        status = writer.writeLayout(kLastDefault, layout::kProduct, {}, location);
        // Deliberate: the marker is a value, but the deletion spares subkeys only, so the component that was just
        // written goes too. A later migration therefore takes a new backup.
        deleteTree(registry, KeyHandle::localMachine, layout::kComponents, 0, {}, layout::kVersion9Marker);
    }
    return status;
}

}  // namespace

Status restoreVersion8(IRegistryStore& registry, IServiceManager& services, Report& report, std::string_view location) {
    report.line(kBegin);
    restoreBackup(registry, report);
    const Status status = writeDefaults(registry, report, location);

    // The success line precedes the lines of the service, and none of them may be printed before the commit.
    HeldConsole held;
    Report closing(report, held);
    if (succeeded(status)) {
        closing.line(kDefaultsSet);
    } else {
        report.error(kDefaultsFailed);
        report.error(kLocationFailed);
    }
    switchOffService(services, closing, kService);
    if (const Status committed = registry.commit(); !succeeded(committed)) {
        return committed;
    }
    held.release(report.console());
    return status;
}

}  // namespace kz7
