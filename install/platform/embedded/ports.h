// The ports of this host that need no type of their own. Paths of the product lead into the state directory.
#pragma once

#include <memory>
#include <string>

#include "install/platform/platform.h"

namespace kz7 {

// Repairs what a program may have inherited and the rest relies on; called first thing. Standard descriptors that are
// closed are opened on /dev/null, so that no file of ours takes their number, and the end of a child is not ignored.
void settleInheritedState();

// Shows its texts on standard error if KZ7_DEBUG=1 is set: no debugger listens here.
std::unique_ptr<IDebugOutput> embeddedDebugOutput(IConsole& console);

std::unique_ptr<IFileSystem> embeddedFiles(std::string stateDirectory);
std::unique_ptr<IProcessHost> embeddedProcesses(std::string stateDirectory);
std::unique_ptr<IThreads> embeddedThreads();
std::unique_ptr<ILibraryLoader> embeddedLibraries(std::string stateDirectory);

// Records of the provider files in a location's bin folder, in the registry.
std::unique_ptr<IAssemblyCache> embeddedAssemblies(IRegistryStore& registry, std::string stateDirectory);

std::unique_ptr<IHostInformation> embeddedHost();
std::unique_ptr<ITerminal> embeddedTerminal();

}  // namespace kz7
