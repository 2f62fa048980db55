// Registers the .NET data providers of an install location: removes older ones of its level, adds its own to the
// assembly cache, runs the product's configuration programs for both frameworks and rewrites the version aliases.
#pragma once

#include <string>
#include <string_view>

#include "install/platform/assembly_cache.h"
#include "install/platform/console.h"
#include "install/platform/file_system.h"
#include "install/platform/library_loader.h"
#include "install/platform/process_host.h"
#include "install/platform/registry_store.h"
#include "install/platform/threads.h"
#include "install/src/registry/report.h"

namespace kz7 {

struct ProviderPorts {
    IRegistryStore& registry;
    ILibraryLoader& libraries;
    IAssemblyCache& assemblies;
    IFileSystem& files;
    IProcessHost& processes;
    IThreads& threads;
    IDebugOutput& debug;
    Report& report;
};

// Queries the product library of a location for its level, a dotted text such as "9.1.0.0", and prints it. A failure is
// reported and leaves `level` unchanged.
void queryLevel(ILibraryLoader& libraries, Report& report, std::string_view location, std::string& level);

// Returns the result of the alias rewrite; failures before it are only reported. Commits before each program is
// started and at the end; a commit that fails ends the registration with its status.
Status registerProviders(const ProviderPorts& ports, std::string_view location);

}  // namespace kz7
