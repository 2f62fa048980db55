#include "install/src/uselvlkz7reg.h"

#include <algorithm>
#include <array>

#include "install/src/add_copy.h"
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

enum class Option { version9, version8, providers, remove, add, addVersion9 };

struct OptionRow {
    std::string_view word;
    std::size_t arguments;  // after it
    Option option;
    bool startsPrograms;
};

// clang-format off
constexpr std::array kOptions = {
    OptionRow{"-v9",            1, Option::version9,    true},
    OptionRow{"-v8",            1, Option::version8,    false},
    OptionRow{"-dotnet",        1, Option::providers,   true},
    OptionRow{"-removeKZ7Copy", 1, Option::remove,      false},
    OptionRow{"-addKZ7Copy",    2, Option::add,         false},
    OptionRow{"-addv9",         2, Option::addVersion9, true},
};
// clang-format on

// `arguments` begins with the program's name. Null: no option matches.
const OptionRow* findOption(std::span<const char* const> arguments) {
    const auto* const row = std::find_if(kOptions.begin(), kOptions.end(), [&](const OptionRow& option) {
        return arguments.size() == option.arguments + 2 && equalsIgnoreCase(arguments[1], option.word);
    });
    return row == kOptions.end() ? nullptr : row;
}

class Tool {
public:
    Tool(const Ports& ports, std::vector<ErrorLine>* errors) : ports_(ports), report_(*ports.console, errors) {}

    Status run(std::span<const char* const> arguments) {
        const OptionRow* const row = findOption(arguments);
        if (row == nullptr) {
            // Deliberate: the usage lists only the two copy options; the others are for installers.
            report_.line(kUsage);
            return kInvalidParameter;
        }
        const char* const first = arguments[2];
        switch (row->option) {
            case Option::version9:
                return migrateToVersion9(
                    *ports_.registry, *ports_.services, report_,
                    [this](std::string_view location) { return level(location); },
                    [this](std::string_view location) { return registerProvidersOf(location); }, first);
            case Option::version8:
                return restoreVersion8(*ports_.registry, *ports_.services, report_, first);
            case Option::providers:
                return registerProvidersOf(first);
            case Option::remove:
                return removeCopy(*ports_.registry, *ports_.services, *ports_.debugOutput, report_, first);
            case Option::add:
            case Option::addVersion9:
                break;
        }
        return add({first, arguments[3]}, row->option == Option::addVersion9);
    }

private:
    Status add(const CopyRequest& request, bool withProviders) {
        const Status added = addCopy(*ports_.registry, *ports_.services, report_, {}, request);
        if (const Status committed = ports_.registry->commit(); !succeeded(committed)) {
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
        queryLevel(*ports_.libraries, report_, location, text);
        return text;
    }

    Status registerProvidersOf(std::string_view location) {
        return registerProviders({*ports_.registry, *ports_.libraries, *ports_.assemblies, *ports_.files,
                                  *ports_.processes, *ports_.threads, *ports_.debugOutput, report_},
                                 location);
    }

    const Ports& ports_;
    Report report_;
};

}  // namespace

std::vector<std::string_view> toolOptions() {
    std::vector<std::string_view> words;
    words.reserve(std::size(kOptions));
    for (const OptionRow& option : kOptions) {
        words.push_back(option.word);
    }
    return words;
}

bool isToolCommand(std::span<const char* const> arguments) {
    return findOption(arguments) != nullptr;
}

bool startsPrograms(std::span<const char* const> arguments) {
    const OptionRow* const row = findOption(arguments);
    return row != nullptr && row->startsPrograms;
}

Status runTool(const Ports& ports, std::span<const char* const> arguments, std::vector<ErrorLine>* errors) {
    return Tool(ports, errors).run(arguments);
}

}  // namespace kz7
