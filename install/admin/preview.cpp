#include "install/admin/preview.h"

#include "install/platform/assembly_records.h"

namespace kz7 {

Preview::Preview(IPlatform& machine, bool asksLevel)
    : machine_(machine),
      services_(registry_, machine.files()),
      assemblies_(machine.assembliesOn(registry_)),
      recorded_(memoryPorts(asksLevel), machine.storeIsOwn()) {
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
    if (!asksLevel) {
        ports.libraries = &noLibraries_;
    }
    return ports;
}

// What is there above a key is not created by a flow.
Status Preview::copyParents(IRegistryStore& live, std::string_view path) {
    Status status = kSuccess;
    for (std::size_t end = path.find('\\'); status == kSuccess && end != std::string_view::npos;
         end = path.find('\\', end + 1)) {
        OwnedKey key(live);
        OwnedKey copied(registry_);
        status = live.openKey(KeyHandle::localMachine, path.substr(0, end), kKeyQueryValue, key.receive());
        if (isNotFound(status)) {
            return kSuccess;
        }
        if (status == kSuccess) {
            status =
                registry_.createKey(KeyHandle::localMachine, path.substr(0, end), {}, kKeySetValue, copied.receive());
        }
    }
    return status;
}

Status Preview::fill(std::string& key) {
    IRegistryStore& live = machine_.registry();
    std::vector<KeyStart> starts;
    Status status = findEverything(live, false, starts);
    if (KeyStart records;
        status == kSuccess && machine_.storeIsOwn() &&
        findKey(live, {KeyHandle::localMachine, std::string(kAssemblyRecords)}, records) == kSuccess) {
        starts.push_back(std::move(records));
    }
    for (const std::string_view path : kProductKeys) {
        if (status == kSuccess) {
            status = copyParents(live, path);
        }
    }
    if (status == kSuccess && machine_.storeIsOwn()) {
        status = copyParents(live, kAssemblyRecords);
    }
    Snapshot snapshot;
    status = status == kSuccess ? readSnapshot(live, machine_.storeIsOwn(), starts, snapshot, key) : status;
    for (auto record = snapshot.begin(); status == kSuccess && record != snapshot.end(); ++record) {
        KeyName name;
        parseKeyName(record->name, name);
        OwnedKey copied(registry_);
        status = registry_.createKey(name.root, name.path, record->keyClass, kKeySetValue, copied.receive());
        for (const KeyValue& value : record->values) {
            status = status == kSuccess ? registry_.setValue(copied.get(), value.name, value.type, value.data) : status;
        }
    }
    // The end of the live store's transaction.
    live.commit();
    return status;
}

}  // namespace kz7
