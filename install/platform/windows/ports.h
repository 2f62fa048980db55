// The ports of this host. Each factory is in the source file that is named after its port.
#pragma once

#include <memory>

#include "install/platform/platform.h"

namespace kz7 {

class ChangeLock;

std::unique_ptr<IRegistryStore> windowsRegistry(ChangeLock& lock);
std::unique_ptr<IServiceManager> windowsServices(ChangeLock& lock);
std::unique_ptr<IConsole> windowsConsole();
std::unique_ptr<IFileSystem> windowsFiles();
std::unique_ptr<IProcessHost> windowsProcesses();
std::unique_ptr<IThreads> windowsThreads();
std::unique_ptr<ILibraryLoader> windowsLibraries();

// `isPreview`: opens the caches and leaves them as they are.
std::unique_ptr<IAssemblyCache> windowsAssemblies(IFileSystem& files, bool isPreview);

std::unique_ptr<IHostInformation> windowsHost();
std::unique_ptr<ITerminal> windowsTerminal();
std::unique_ptr<IHistory> windowsHistory(IDebugOutput& debugOutput);

}  // namespace kz7
