// A machine in memory whose flows meet the faults, in any of its ports. What is asked of its plain members meets none.
#pragma once

#include <utility>

#include "install/platform/faulty/assembly_cache.h"
#include "install/platform/faulty/clock.h"
#include "install/platform/faulty/console.h"
#include "install/platform/faulty/fault_counter.h"
#include "install/platform/faulty/file_system.h"
#include "install/platform/faulty/host_identity.h"
#include "install/platform/faulty/library_loader.h"
#include "install/platform/faulty/process_host.h"
#include "install/platform/faulty/registry.h"
#include "install/platform/faulty/services.h"
#include "install/platform/faulty/threads.h"
#include "install/platform/memory/platform.h"

namespace kz7 {

// `Machine` is a MemoryPlatform.
template <typename Machine>
class FaultyPlatform : public Machine {
public:
    explicit FaultyPlatform(FaultCounter faults) : faults_(std::move(faults)) {}

    IRegistryStore& registry() override { return faultyRegistry_; }
    IServiceManager& services() override { return faultyServices_; }
    IConsole& console() override { return faultyConsole_; }
    IFileSystem& files() override { return faultyFiles_; }
    IProcessHost& processes() override { return faultyProcesses_; }
    IThreads& threads() override { return faultyThreads_; }
    ILibraryLoader& libraries() override { return faultyLibraries_; }
    IAssemblyCache& assemblies() override { return faultyAssemblies_; }
    IClock& clock() override { return faultyClock_; }
    IHostIdentity& identity() override { return faultyIdentity_; }

    FaultCounter faults_;

private:
    FaultyRegistry faultyRegistry_{this->registry_, faults_};
    FaultyServiceManager faultyServices_{this->services_, faults_};
    FaultyConsole faultyConsole_{this->console_, faults_};
    FaultyFileSystem faultyFiles_{this->files_, faults_};
    FaultyProcessHost faultyProcesses_{this->processes_, faults_};
    FaultyThreads faultyThreads_{this->threads_, faults_};
    FaultyLibraryLoader faultyLibraries_{this->libraries_, faults_};
    FaultyAssemblyCache faultyAssemblies_{this->assemblies_, faults_};
    FaultyClock faultyClock_{this->clock_, faults_};
    FaultyHostIdentity faultyIdentity_{this->identity_, faults_};
};

}  // namespace kz7
