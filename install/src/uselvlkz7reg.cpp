#include "install/src/uselvlkz7reg.h"

#include "install/src/add_copy.h"
#include "install/src/registry/report.h"
#include "install/src/remove_copy.h"
#include "install/src/services/provider_registration.h"
#include "install/src/version8.h"
#include "install/src/version9.h"

namespace kz7 {
namespace {

constexpr std::string_view kUsage =
    "Supported Command Line Options\n\n\n"
    " -addKZ7Copy [installName] [installLocation] - this will set up a computer to for \n"
    " very basic KZ7 functionality. This option depends on a valid directory existing \n"
    " with all of the files needed for KZ7 to operate properly that is specified with \n"
    " the [installLocation] parameter.  The [installname] parameter is a name specified \n"
    " to refer to this copy.  This will only have very basic functionality - no  \n"
    " instance and no KZ7 Administration server will be setup \n"
    " installName without any instances and this copy can be used like a \n"
    " multiple copy version.  This option will also not set up any shortcuts \n"
    " or system environment variables.\n\n\n"
    " -removeKZ7Copy [installName] - this can remove a copy that has been created using \n"
    " -addKZ7Copy.  This cannot be used to remove a copy installed with the KZ7 Setup Wizard\n"
    " \n";

class Tool {
public:
    explicit Tool(IPlatform& platform) : platform_(platform), report_(platform.console()) {}

    Status run(std::span<const char* const> arguments) {
        if (arguments.size() == 3) {
            const std::string_view option = arguments[1];
            if (equalsIgnoreCase(option, "-v9")) {
                return migrateToVersion9(
                    platform_.registry(), platform_.services(), report_,
                    [this](std::string_view location) { return level(location); },
                    [this](std::string_view location) { return registerProvidersOf(location); }, arguments[2]);
            }
            if (equalsIgnoreCase(option, "-v8")) {
                return restoreVersion8(platform_.registry(), platform_.services(), platform_.console(), arguments[2]);
            }
            if (equalsIgnoreCase(option, "-dotnet")) {
                return registerProvidersOf(arguments[2]);
            }
            if (equalsIgnoreCase(option, "-removeKZ7Copy")) {
                return removeCopy(platform_.registry(), platform_.services(), platform_.debugOutput(), report_,
                                  arguments[2]);
            }
        }
        if (arguments.size() == 4) {
            const std::string_view option = arguments[1];
            const bool withProviders = equalsIgnoreCase(option, "-addv9");
            if (withProviders || equalsIgnoreCase(option, "-addKZ7Copy")) {
                return add({arguments[2], arguments[3]}, withProviders);
            }
        }
        // Deliberate: the usage lists only the two copy options; the others are for installers.
        report_.line(kUsage);
        return kInvalidParameter;
    }

private:
    Status add(const CopyRequest& request, bool withProviders) {
        const Status added = addCopy(platform_.registry(), platform_.services(), report_, {}, request);
        if (const Status committed = platform_.registry().commit(); !succeeded(committed)) {
            return committed;
        }
        if (succeeded(added)) {
            reportAdded(report_, request);
        }
        // Deliberate: the registration gets the copy's name as its location, and the result of the add is ignored; the
        // installers that use "-addv9" expect both.
        return withProviders ? registerProvidersOf(request.name) : added;
    }

    std::string level(std::string_view location) {
        std::string text;
        queryLevel(platform_.libraries(), report_, location, text);
        return text;
    }

    Status registerProvidersOf(std::string_view location) {
        return registerProviders(
            {platform_.registry(), platform_.libraries(), platform_.assemblies(), platform_.files(),
             platform_.processes(), platform_.threads(), platform_.console(), platform_.debugOutput()},
            location);
    }

    IPlatform& platform_;
    Report report_;
};

}  // namespace

Status runTool(IPlatform& platform, std::span<const char* const> arguments) {
    return Tool(platform).run(arguments);
}

}  // namespace kz7
