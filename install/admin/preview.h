// A run that changes nothing: the flow works in memory, on a copy of the product's keys and services.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "install/platform/memory/process_host.h"
#include "install/platform/memory/registry.h"
#include "install/platform/memory/small_ports.h"
#include "install/platform/platform.h"
#include "install/platform/service_records.h"
#include "install/src/registry/change_recorder.h"
#include "install/src/registry/key_changes.h"

namespace kz7 {

class Preview {
public:
    // Files and, with `asksLevel`, the level library are those of `machine`. Programs are listed and not started; each
    // counts as one that ended with 0.
    Preview(IPlatform& machine, bool asksLevel);

    // Copies the product's keys and services. On failure `key` names the key that cannot be read.
    Status fill(std::string& key);

    // Copies what the changes of an import touch.
    Status fill(const std::vector<KeyChange>& changes, std::string& key);

    const Ports& ports() const { return recorded_.ports(); }
    ChangeSet changes() const { return recorded_.changes(); }

    // The command lines of the programs that would run, in order.
    const std::vector<std::string>& programs() const { return processes_.started; }

    MemoryConsole& console() { return console_; }

private:
    Ports memoryPorts(bool asksLevel);
    Status copyParents(const KeyName& name);
    Status copyKeys(const Snapshot& keys);
    Status copyTouched(const KeyChange& change, std::string& key);

    IPlatform& machine_;
    MemoryRegistry registry_;
    ServiceRecords services_;
    std::unique_ptr<IAssemblyCache> assemblies_;
    MemoryProcessHost processes_;
    MemoryThreads threads_;
    MemoryConsole console_;
    MemoryDebugOutput debugOutput_;
    MemoryLibraryLoader noLibraries_;
    RecordedPorts recorded_;
};

}  // namespace kz7
