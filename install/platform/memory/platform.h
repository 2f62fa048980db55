// A whole machine in memory. Its ports are plain members, so that a test sets them up and reads them.
#pragma once

#include "install/platform/memory/assembly_cache.h"
#include "install/platform/memory/clock.h"
#include "install/platform/memory/console.h"
#include "install/platform/memory/debug_output.h"
#include "install/platform/memory/file_system.h"
#include "install/platform/memory/host_identity.h"
#include "install/platform/memory/library_loader.h"
#include "install/platform/memory/line_channel.h"
#include "install/platform/memory/process_host.h"
#include "install/platform/memory/registry.h"
#include "install/platform/memory/services.h"
#include "install/platform/memory/terminal.h"
#include "install/platform/memory/threads.h"
#include "install/platform/platform.h"

namespace kz7 {

class MemoryPlatform : public IPlatform {
public:
    IRegistryStore& registry() override { return registry_; }
    IServiceManager& services() override { return services_; }
    IConsole& console() override { return console_; }
    IDebugOutput& debugOutput() override { return debugOutput_; }
    IFileSystem& files() override { return files_; }
    IProcessHost& processes() override { return processes_; }
    IThreads& threads() override { return threads_; }
    ILibraryLoader& libraries() override { return libraries_; }
    IAssemblyCache& assemblies() override { return assemblies_; }
    ILineChannel& lines() override { return lines_; }
    IClock& clock() override { return clock_; }
    ITerminal& terminal() override { return terminal_; }
    IHostIdentity& identity() override { return identity_; }
    Status ownFolder(std::string& path) override {
        path = "C:\\KZ7State";
        return kSuccess;
    }
    std::string storeName() override { return "memory"; }
    std::string storeNote() override { return {}; }
    bool storeIsOwn() override { return true; }
    bool storeFaultTold() override { return false; }

    MemoryRegistry registry_;
    MemoryFileSystem files_;
    MemoryServiceManager services_{files_};
    MemoryConsole console_;
    MemoryDebugOutput debugOutput_;
    MemoryProcessHost processes_;
    MemoryThreads threads_;
    MemoryLibraryLoader libraries_;
    MemoryAssemblyCache assemblies_{registry_};
    MemoryLineChannel lines_;
    MemoryClock clock_;
    MemoryTerminal terminal_;
    MemoryHostIdentity identity_;
};

}  // namespace kz7
