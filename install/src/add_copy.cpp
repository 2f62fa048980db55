#include "install/src/add_copy.h"

#include <array>

#include "install/src/registry/copy_layout.h"
#include "install/src/registry/registry_access.h"
#include "install/src/registry/row_writer.h"
#include "install/src/services/management_service.h"

namespace kz7 {
namespace {

// clang-format off
constexpr ErrorText kLevelFailed    {793, "Unable to set the Version registry key .NET Apps will not work\n"};
constexpr ErrorText kLevel32Failed  {809, "Unable to set the Version registry key in 32-bit registry hive. .NET Apps will not work\n"};
constexpr ErrorText kAddFailed      {941, "Unable to add a new copy of KZ7 to this machine : rc = %d\n"};

constexpr std::string_view kLevelSet    = "Full Version registry key set to %s\n";
constexpr std::string_view kLevel32Set  = "Full Version registry key set to %s in the 32-bit registry hive. \n";
constexpr std::string_view kAdded       = "%s install copy at %s added successfully\n";
constexpr std::string_view kServiceFailed =
    "An error occurred while registering the KZ7 Management Service\n"
    "The KZ7 Management service could not be started - some function not \n"
    "yet ported to the new registry layout may not function properly\n";

constexpr std::array kCopyRows = {
    LayoutRow{"",               "KZ7 Path Name",         kLocation},
    LayoutRow{"Components",     "BASE_CLIENT",           ""},
    LayoutRow{"Components",     "MULTI_VERSION_SUPPORT", ""},
    LayoutRow{"CurrentVersion", "Modification",          "800"},
    LayoutRow{"CurrentVersion", "Release",               "7"},
    LayoutRow{"CurrentVersion", "Version",               "9"},
    LayoutRow{"CurrentVersion", "Service Level",         "BUILD"},
    LayoutRow{"PROFILES",       "",                      ""},
    LayoutRow{"GLOBAL_PROFILE", "KZ7PATH",               kLocation},
    // Deliberate: this key is spelled DAS_PROFILES elsewhere; names compare without case, so both are one key.
    LayoutRow{"Das_PROFILES",   "",                      ""},
};
// clang-format on

// Names the copy by a version in both views and prints the results.
void setLevelAlias(IRegistryStore& registry, Report& report, std::string_view level, std::string_view copyName) {
    if (succeeded(setText(registry, layout::kCopies, level, copyName))) {
        report.line(kLevelSet, {level});
    } else {
        report.error(kLevelFailed);
    }
    if (succeeded(setText(registry, layout::kCopies32, level, copyName))) {
        report.line(kLevel32Set, {level});
    } else {
        report.error(kLevel32Failed);
    }
}

// Makes the copy the default of both views and names it by its level and every prefix of the level. Failures are
// reported and have no other effect.
void nameByLevel(IRegistryStore& registry, Report& report, const LevelQuery& queryLevel, const CopyRequest& request) {
    RowWriter writer(registry, report);
    writer.write(layout::kCopies, "", request.name);
    writer.write(layout::kCopies32, "", request.name);

    std::string level = queryLevel(request.location);
    for (;;) {
        // Deliberate: a level that could not be read is empty, which writes the default value once more.
        setLevelAlias(registry, report, level, request.name);
        const std::size_t dot = level.rfind('.');
        if (dot == std::string::npos) {
            break;
        }
        level.resize(dot);
    }

    level = queryLevel(request.location);
    if (const std::size_t dot = level.rfind('.'); dot != std::string::npos) {
        const std::string defaultLevel = compose("%s.DEF.2", {std::string_view(level).substr(0, dot)});
        for (const std::string_view copies : {layout::kCopies, layout::kCopies32}) {
            writer.write(copies, defaultLevel, request.name);
            writer.write(copies, "defaultClientInterfaceCopy", request.name);
        }
    }
    writer.write(layout::kCopies, "8.1.11", request.name);
}

}  // namespace

std::span<const LayoutRow> copyRows() {
    return kCopyRows;
}

Status addCopy(IRegistryStore& registry, IServiceManager& services, Report& report, const LevelQuery& level,
               const CopyRequest& request) {
    RowWriter writer(registry, report);
    const Status native = writer.writeLayout(kCopyRows, layout::kCopy, request.name, request.location);
    const Status other = writer.writeLayout(kCopyRows, layout::kCopy32, request.name, request.location);
    Status status = succeeded(native) ? other : native;
    if (succeeded(status)) {
        if (request.isV9) {
            nameByLevel(registry, report, level, request);
        }
        status = registerManagementService(registry, services, report, request.location, request.name, false);
        if (!succeeded(status)) {
            report.line(kServiceFailed);
        }
    }
    if (!succeeded(status)) {
        report.error(kAddFailed, {status});
    }
    return status;
}

void reportAdded(Report& report, const CopyRequest& request) {
    report.line(kAdded, {request.name, request.location});
}

}  // namespace kz7
