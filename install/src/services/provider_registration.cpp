#include "install/src/services/provider_registration.h"

#include <algorithm>
#include <array>
#include <cstring>

#include "install/platform/encoding.h"
#include "install/platform/text.h"
#include "install/runtime/install_process.h"
#include "install/src/copies/alias_rewrite.h"

namespace kz7 {
namespace {

// The record that the product library fills with its level.
struct sqleLevelInfo {
    char level[256];
};
using LevelEntry = int (*)(std::uint32_t version, sqleLevelInfo* info);
constexpr std::uint32_t kLevelVersion = 0x09010000;
constexpr std::string_view kLevelPrefix = "KZ7 v";

struct ConfigurationProgram {
    std::string_view name;
    std::string_view lastArgument;
    ErrorText failed;
    ErrorText refused;
};

// clang-format off
constexpr ErrorText kNoLevelEntry      {595,  "Unable to resolve the sqleGetLevelInfo from %s\n"};
constexpr ErrorText kNoLevelLibrary    {601,  "Unable to load %s\n"};
constexpr ErrorText kNoLevel           {607,  "Unable to retrieve the version of the sqllib\n"};
constexpr ErrorText kNotDeregistered   {1602, "Unable to deregister the KZ7 .NET Data Provider - %s\n"};
constexpr ErrorText kCacheToolFailed   {1629, "Failed to register 32-bit KZ7 .net data provider to GAC.  rc = %d\n"};
constexpr ErrorText kNotInCache        {1636, "Some provider versions were not registered in the GAC because you don't have the appropriate framework installed\n"};

constexpr std::array kConfigurationPrograms = {
    ConfigurationProgram{"kz7nmpcfg.exe",    "",
                         {1668, "Failed to execute kz7nmpcfg.exe command.  rc = %d\n"},
                         {1677, "kz7nmpcfg.exe returned an error. rc = %d\n"}},
    ConfigurationProgram{"kz7nmpcfg_32.exe", " -migratev8 ",
                         {1689, "Failed to execute kz7nmpcfg_32.exe command.  rc = %d\n"},
                         {1697, "kz7nmpcfg_32.exe returned an error. rc = %d\n"}},
};

constexpr std::string_view kLevelReturned       = "Level Returned: %s\n";
constexpr std::string_view kLibraryPath         = "%s\\bin\\kz7install64.dll";
constexpr std::string_view kCacheTool           = "%s\\bin\\kz7nmpgac32.exe";
constexpr std::string_view kCacheToolRoot       = "%sbin\\kz7nmpgac32.exe";
constexpr std::string_view kCacheToolRun        = "%s -i \"%s\" ";
constexpr std::string_view kConfiguration       = "%s\\bin\\%s -register -level %s -kz7path %s";
// Deliberate: the line feed is part of the command, before the text that is appended; the programs expect it.
constexpr std::string_view kConfigurationRoot   = "%sbin\\%s -register -level %s -kz7path %s\n";
// clang-format on

using FilePath = FixedText<261>;
using Command = FixedText<1001>;

// From the third component on, the two characters of the build are left out; the text does not end in a dot.
std::string shortenedLevel(std::string_view dotted) {
    std::string level;
    for (int component = 1;; ++component) {
        const std::size_t dot = dotted.find('.');
        std::string_view text = dotted.substr(0, dot);
        if (component >= 3 && text.size() >= 3) {
            text.remove_suffix(2);
        }
        level += text;
        if (dot == std::string_view::npos) {
            break;
        }
        level += '.';
        dotted.remove_prefix(dot + 1);
    }
    while (level.ends_with('.')) {
        level.pop_back();
    }
    return level;
}

bool askLevel(LevelEntry entry, std::string& level) {
    sqleLevelInfo info{};
    if (entry(kLevelVersion, &info) != 0) {
        return false;
    }
    std::string_view text(info.level, strnlen(info.level, sizeof info.level));
    if (!text.starts_with(kLevelPrefix)) {
        return false;
    }
    text.remove_prefix(kLevelPrefix.size());
    // The library is foreign code and expects the narrow encoding.
    level = shortenedLevel(textFromNarrow(text));
    return true;
}

bool readLevel(ILibraryLoader& libraries, Report& report, std::string_view location, std::string& level) {
    const FilePath path(compose(kLibraryPath, {location}));
    OwnedLibrary library(libraries);
    if (!succeeded(libraries.load(path.view(), library.receive()))) {
        report.error(kNoLevelLibrary, {path.view()});
        return false;
    }
    LibraryFunction entry = nullptr;
    if (!succeeded(libraries.resolve(library.get(), "sqleGetLevelInfo", entry))) {
        report.error(kNoLevelEntry, {path.view()});
        return false;
    }
    return askLevel(reinterpret_cast<LevelEntry>(entry), level);
}

class Registration {
public:
    Registration(const ProviderPorts& ports, std::string_view location)
        : ports_(ports), report_(ports.report), location_(location), atRoot_(location.ends_with('\\')) {}

    Status run() {
        std::string level;
        queryLevel(ports_.libraries, report_, location_, level);
        level.resize(std::min(level.rfind('.'), level.size()));
        if (!succeeded(ports_.assemblies.deregisterProviders(level))) {
            report_.error(kNotDeregistered, {level});
        }
        Status committed = kSuccess;
        if (succeeded(ports_.assemblies.registerProviders(location_, level, kFrameworkAll))) {
            committed = runCacheTool();
        } else {
            report_.error(kNotInCache);
        }
        for (const ConfigurationProgram& program : kConfigurationPrograms) {
            committed = succeeded(committed) ? configure(program, level) : committed;
        }
        if (!succeeded(committed)) {
            return committed;
        }
        const Status rewritten = rewriteInstallCopiesProfile(ports_.registry, ports_.debug);
        committed = ports_.registry.commit();
        return succeeded(committed) ? rewritten : committed;
    }

private:
    // This and configure() return the status of the commit before their program. After a failed commit nothing is
    // started or printed.
    Status runCacheTool() {
        const Command tool(compose(atRoot_ ? kCacheToolRoot : kCacheTool, {location_}));
        if (!succeeded(ports_.files.probe(tool.view()))) {
            return kSuccess;
        }
        if (const Status committed = ports_.registry.commit(); !succeeded(committed)) {
            return committed;
        }
        std::uint32_t exitCode = 0;  // ignored
        const Status status = runProgram(Command(compose(kCacheToolRun, {tool.view(), location_})), exitCode);
        if (!succeeded(status)) {
            report_.error(kCacheToolFailed, {status});
        }
        return kSuccess;
    }

    Status configure(const ConfigurationProgram& program, std::string_view level) {
        if (const Status committed = ports_.registry.commit(); !succeeded(committed)) {
            return committed;
        }
        Command command(
            compose(atRoot_ ? kConfigurationRoot : kConfiguration, {location_, program.name, level, location_}));
        command.append(program.lastArgument);
        report_.line("%s", {command.view()});
        std::uint32_t exitCode = 0;
        const Status status = runProgram(command, exitCode);
        if (!succeeded(status)) {
            report_.error(program.failed, {status});
        } else if (exitCode != 0) {
            // Deliberate: the program's output is not shown; the error has always been a single line.
            report_.error(program.refused, {exitCode});
        }
        return kSuccess;
    }

    // Runs a program to its end. The flush puts its output after the lines printed so far.
    Status runProgram(const Command& command, std::uint32_t& exitCode) {
        report_.console().flush();
        QuietSink sink;
        InstallProcess process(ports_.processes, ports_.threads, sink, command.c_str());
        const Status executed = process.execute(true, false);
        const Status waited = process.waitForCompletion(exitCode, kInfiniteWait);
        return succeeded(executed) ? waited : executed;
    }

    const ProviderPorts& ports_;
    Report& report_;
    std::string_view location_;
    bool atRoot_;
};

}  // namespace

void queryLevel(ILibraryLoader& libraries, Report& report, std::string_view location, std::string& level) {
    // Deliberate: if the level cannot be read, the commands have an empty level, not the product's own.
    if (!readLevel(libraries, report, location, level)) {
        report.error(kNoLevel);
    }
    report.line(kLevelReturned, {level});
}

Status registerProviders(const ProviderPorts& ports, std::string_view location) {
    return Registration(ports, location).run();
}

}  // namespace kz7
