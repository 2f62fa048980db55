// The ports of this host whose classes are private. Product paths lead to the state directory.
#pragma once

#include <memory>
#include <string>

#include "install/platform/platform.h"

namespace kz7 {

// Repairs inherited state that the rest relies on; called first. Opens closed standard descriptors on /dev/null, so
// that no file gets their number, and stops ignoring the end of children.
void settleInheritedState();

std::unique_ptr<IFileSystem> embeddedFiles(std::string stateDirectory);
std::unique_ptr<IProcessHost> embeddedProcesses(std::string stateDirectory);
std::unique_ptr<IThreads> embeddedThreads();
std::unique_ptr<ILibraryLoader> embeddedLibraries(std::string stateDirectory);

std::unique_ptr<IHostInformation> embeddedHost();
std::unique_ptr<ITerminal> embeddedTerminal();

}  // namespace kz7
