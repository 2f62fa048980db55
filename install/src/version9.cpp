#include "install/src/version9.h"

#include <string>

#include "install/src/registry/copy_layout.h"
#include "install/src/registry/registry_access.h"
#include "install/src/services/management_service.h"

namespace kz7 {
namespace {

constexpr std::string_view kMigratedCopy = "kz7build";

// clang-format off
constexpr ErrorText kBackupCopyFailed  {421,  "Failed to copy copy %s to %s\n"};
constexpr ErrorText kBackupFailed      {1345, "Error occurred while backing up old registry\n"};
constexpr ErrorText kGlobalFailed      {1360, "Failed to copy GLOBAL_PROFILE.  You may need to update some Global Profile Registry variables.\n"};
constexpr ErrorText kCopyFailed        {1372, "Unable to create the registry key entries for the version 9 InstallCopy\n"};
constexpr ErrorText kInstancesFailed   {1388, "Failed to copy prior instances.  You may need to run kz7icrt to create any instances that you need.\n"};
constexpr ErrorText kDasFailed         {1406, "Failed to DAS Profiles from Version 8.  You may need to run dascrt for the KZ7 Administration Server to work.\n"};

constexpr std::string_view kNoBackup         = "Version 9 Registry exists - no backup needed\n";
constexpr std::string_view kBackingUp        = "Backing up V8 Registry\n";
constexpr std::string_view kGlobalCopied     = "GLOBAL_PROFILE successfully copied from prior version\n";
constexpr std::string_view kCreating         = "Creating full version 9 registry\n";
constexpr std::string_view kInstancesCopied  = "Instances successfully copied from prior version\n";
constexpr std::string_view kDasCopied        = "DAS Profiles successfully copied from prior version\n";
constexpr std::string_view kConfigured       = "Version 9 registry is configured successfully\n";
constexpr std::string_view kServiceFailed    =
    "An error occurred while registering the KZ7 Management Service\n"
    "The KZ7 Management service could not be started - some function not\n"
    "yet ported to the new registry layout may not function properly\n";
// clang-format on

bool isVersion9(IRegistryStore& registry) {
    OwnedKey components(registry);
    // Deliberate: the marker is expected in the product's own components, but copies have it in theirs, so every
    // further migration replaces the old backup.
    return succeeded(
               registry.openKey(KeyHandle::localMachine, layout::kComponents, kKeyQueryValue, components.receive())) &&
           valueExists(registry, components.get(), layout::kVersion9Marker);
}

bool backUp(IRegistryStore& registry, Report& report) {
    report.line(kBackingUp);
    if (!succeeded(TreeCopy(registry).copy(KeyHandle::localMachine, layout::kProduct, KeyHandle::localMachine,
                                           layout::kBackup, true))) {
        report.error(kBackupCopyFailed, {layout::kProduct, layout::kBackup});
        report.error(kBackupFailed);
        return false;
    }
    deleteTree(registry, KeyHandle::localMachine, layout::kProduct, 0, {}, "InstalledCopies");
    return true;
}

// Copies one profile key from the backup; values that the copy already has remain.
void copyProfile(IRegistryStore& registry, Report& report, std::string_view profile, std::string_view copied,
                 const ErrorText& failed) {
    const std::string source = compose("%s\\%s", {layout::kBackup, profile});
    const std::string target = compose("%s\\%s\\%s", {layout::kCopies, kMigratedCopy, profile});
    if (succeeded(TreeCopy(registry).copy(KeyHandle::localMachine, source, KeyHandle::localMachine, target, false))) {
        report.line(copied);
    } else {
        report.error(failed);
    }
}

void migrate(IRegistryStore& registry, IServiceManager& services, Report& report, const LevelQuery& level,
             std::string_view location) {
    // Deliberate: a version-9 registry is refreshed; only the steps that take or read a backup are skipped.
    const bool refresh = isVersion9(registry);
    if (refresh) {
        report.line(kNoBackup);
    } else {
        if (!backUp(registry, report)) {
            return;
        }
        // Before the copy is added, so that its own location replaces the old one.
        copyProfile(registry, report, "GLOBAL_PROFILE", kGlobalCopied, kGlobalFailed);
    }
    report.line(kCreating);
    const CopyRequest request{kMigratedCopy, location, true};
    if (!succeeded(addCopy(registry, services, report, level, request))) {
        report.error(kCopyFailed);
        return;
    }
    reportAdded(report, request);
    if (!refresh) {
        copyProfile(registry, report, "PROFILES", kInstancesCopied, kInstancesFailed);
        copyProfile(registry, report, "DAS_PROFILES", kDasCopied, kDasFailed);
    }
    // The add has just created the service, so the start that is requested here never happens.
    if (succeeded(registerManagementService(registry, services, report, location, kMigratedCopy, true))) {
        report.line(kConfigured);
    } else {
        report.bareError(kServiceFailed);
    }
}

}  // namespace

Status migrateToVersion9(IRegistryStore& registry, IServiceManager& services, Report& report, const LevelQuery& level,
                         const ProviderRegistration& registerProviders, std::string_view location) {
    migrate(registry, services, report, level, location);
    return registerProviders(location);
}

}  // namespace kz7
