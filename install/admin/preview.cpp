#include "install/admin/preview.h"

#include "install/platform/assembly_records.h"
#include "install/platform/registry_path.h"

namespace kz7 {

Preview::Preview(IPlatform& machine, bool asksLevel)
    : machine_(machine),
      services_(registry_, machine.files()),
      assemblies_(machine.assembliesOn(registry_)),
      recorded_(memoryPorts(asksLevel), {.wholeServices = machine.storeIsOwn(), .holdsCommits = true}) {
    processes_.otherPrograms = ScriptedProgram{};
}

Ports Preview::memoryPorts(bool asksLevel) {
    Ports ports = machine_.ports();
    ports.registry = &registry_;
    ports.services = &services_;
    ports.console = &console_;
    ports.debugOutput = &debugOutput_;
    ports.processes = &processes_;
    ports.threads = &threads_;
    ports.assemblies = assemblies_.get();
    ports.history = nullptr;
    if (!asksLevel) {
        ports.libraries = &noLibraries_;
    }
    return ports;
}

// What exists above a key is not created by a flow. Spelled as the machine spells it.
Status Preview::copyParents(const KeyName& name) {
    IRegistryStore& live = machine_.registry();
    KeyReader reader(live);
    OwnedKey parent(live);
    OwnedKey copy(registry_);
    Status status = live.openKey(name.root, {}, kKeyWalk, parent.receive());
    std::string_view rest = name.path;
    std::string path;
    for (std::string_view part; status == kSuccess && takeName(rest, part) && !rest.empty();) {
        Subkey found;
        status = reader.subkey(parent.get(), part, found);
        if (status == kSuccess) {
            path += (path.empty() ? "" : "\\") + found.name;
            status = registry_.createKey(name.root, path, found.keyClass, kKeySetValue, copy.receive());
        }
        status = status == kSuccess ? live.openKey(name.root, path, kKeyWalk, parent.receive()) : status;
    }
    return isNotFound(status) ? kSuccess : status;
}

Status Preview::copyKeys(const Snapshot& keys) {
    Status status = kSuccess;
    for (auto record = keys.begin(); status == kSuccess && record != keys.end(); ++record) {
        KeyName name;
        parseKeyName(record->name, name);
        OwnedKey copied(registry_);
        status = registry_.createKey(name.root, name.path, record->keyClass, kKeySetValue, copied.receive());
        for (const KeyValue& value : record->values) {
            status = status == kSuccess ? registry_.setValue(copied.get(), value.name, value.type, value.data) : status;
        }
    }
    return status;
}

Status Preview::fill(std::string& key) {
    IRegistryStore& live = machine_.registry();
    const bool isOwn = machine_.storeIsOwn();
    std::vector<KeyStart> starts;
    Status status = findEverything(live, false, starts);
    std::vector<std::string_view> paths(kProductKeys.begin(), kProductKeys.end());
    if (isOwn) {
        paths.push_back(kAssemblyRecords);
        KeyStart records;
        if (status == kSuccess &&
            findKey(live, {KeyHandle::localMachine, std::string(kAssemblyRecords)}, records) == kSuccess) {
            starts.push_back(std::move(records));
        }
    }
    for (const std::string_view path : paths) {
        status = status == kSuccess ? copyParents({KeyHandle::localMachine, std::string(path)}) : status;
    }
    Snapshot snapshot;
    status = status == kSuccess ? readSnapshot(live, isOwn, starts, snapshot, key) : status;
    status = status == kSuccess ? copyKeys(snapshot) : status;
    live.commit();  // the end of its transaction
    return status;
}

Status Preview::copyTouched(const KeyChange& change, std::string& key) {
    IRegistryStore& live = machine_.registry();
    key = fullKeyName(change.name);
    Status status = copyParents(change.name);
    KeyStart start;
    status = status == kSuccess ? findKey(live, change.name, start) : status;
    if (status != kSuccess) {
        return isNotFound(status) ? kSuccess : status;
    }
    Snapshot tree;
    status = walkKeys(live, start, [&](const KeyRecord& record) {
        key = record.name;
        tree.push_back(record);
        return record.status != kSuccess || change.remove ? record.status : kNoMoreItems;
    });
    return status == kSuccess || isEndOfItems(status) ? copyKeys(tree) : status;
}

Status Preview::fill(const std::vector<KeyChange>& changes, std::string& key) {
    Status status = kSuccess;
    for (auto change = changes.begin(); status == kSuccess && change != changes.end(); ++change) {
        status = copyTouched(*change, key);
    }
    machine_.registry().commit();
    return status;
}

}  // namespace kz7
