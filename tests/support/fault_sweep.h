// Runs a flow again and again, failing its first call, its second, and so on until a run passes untouched.
#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <optional>
#include <string>

#include "install/platform/faulty/assembly_cache.h"
#include "install/platform/faulty/console.h"
#include "install/platform/faulty/fault_counter.h"
#include "install/platform/faulty/file_system.h"
#include "install/platform/faulty/library_loader.h"
#include "install/platform/faulty/process_host.h"
#include "install/platform/faulty/registry.h"
#include "install/platform/faulty/services.h"
#include "install/platform/faulty/threads.h"
#include "tests/support/machine.h"

namespace kz7::test {

// A machine whose flows meet the faults; what a test asks of it meets none.
class FaultyMachine : public Machine {
public:
    explicit FaultyMachine(FaultCounter faults) : faults_(faults) {}

    IRegistryStore& registry() override { return faultyRegistry_; }
    IServiceManager& services() override { return faultyServices_; }
    IConsole& console() override { return faultyConsole_; }
    IFileSystem& files() override { return faultyFiles_; }
    ILibraryLoader& libraries() override { return faultyLibraries_; }
    IAssemblyCache& assemblies() override { return faultyAssemblies_; }
    IProcessHost& processes() override { return faultyProcesses_; }
    IThreads& threads() override { return faultyThreads_; }

    FaultCounter faults_;

private:
    FaultyRegistry faultyRegistry_{registry_, faults_};
    FaultyServiceManager faultyServices_{services_, faults_};
    FaultyConsole faultyConsole_{console_, faults_};
    FaultyFileSystem faultyFiles_{files_, faults_};
    FaultyLibraryLoader faultyLibraries_{libraries_, faults_};
    FaultyAssemblyCache faultyAssemblies_{assemblies_, faults_};
    FaultyProcessHost faultyProcesses_{processes_, faults_};
    FaultyThreads faultyThreads_{threads_, faults_};
};

inline constexpr Status kFault = 4321;  // no platform's number, so that it is recognised wherever it goes

// `check` sees every run: the machine afterwards and the flow's status; a failure of it, or something left open, tells
// the call. Returns the number of calls of the run that passed.
inline std::uint64_t sweepFaults(bool forGood, const std::function<void(FaultyMachine&)>& prepare,
                                 const std::function<Status(FaultyMachine&)>& flow,
                                 const std::function<void(FaultyMachine&, Status)>& check) {
    for (std::uint64_t call = 1;; ++call) {
        std::optional<testing::ScopedTrace> row;  // goes after the machine, which looks for what was left open
        FaultyMachine machine(FaultCounter(0, false, kFault));
        prepare(machine);
        machine.faults_ = FaultCounter(call, forGood, kFault);
        const Status status = flow(machine);
        const std::string failed = machine.faults_.failed();
        row.emplace(__FILE__, __LINE__,
                    "call " + std::to_string(call) + " (" + failed + ") fails" + (forGood ? " for good" : ""));
        check(machine, status);
        if (failed.empty()) {
            return machine.faults_.calls();
        }
    }
}

}  // namespace kz7::test
