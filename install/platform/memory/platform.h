// A whole machine in memory. Its ports are public members, so that tests can set them up and read them.
#pragma once

#include "install/platform/assembly_records.h"
#include "install/platform/memory/file_system.h"
#include "install/platform/memory/process_host.h"
#include "install/platform/memory/registry.h"
#include "install/platform/memory/small_ports.h"
#include "install/platform/platform.h"
#include "install/platform/service_records.h"

namespace kz7 {

class MemoryPlatform : public IPlatform {
public:
    MemoryPlatform() {
        ports_ = {&registry_, &services_,  &console_,    &debugOutput_, &files_,   &processes_,
                  &threads_,  &libraries_, &assemblies_, &host_,        &terminal_};
    }
    MemoryPlatform(const MemoryPlatform&) = delete;
    MemoryPlatform& operator=(const MemoryPlatform&) = delete;

    Status ownFolder(std::string& path) override {
        path = "C:\\KZ7State";
        return kSuccess;
    }
    std::string storeName() override { return "memory"; }

    std::unique_ptr<IAssemblyCache> assembliesOn(IRegistryStore& registry) override {
        return std::make_unique<AssemblyRecords>(registry, files_);
    }

    MemoryRegistry registry_;
    MemoryFileSystem files_;
    ServiceRecords services_{registry_, files_};
    MemoryConsole console_;
    MemoryDebugOutput debugOutput_;
    MemoryProcessHost processes_;
    MemoryThreads threads_;
    MemoryLibraryLoader libraries_;
    AssemblyRecords assemblies_{registry_, files_};
    MemoryHost host_;
    MemoryTerminal terminal_;
};

}  // namespace kz7
