#include "install/src/copies/registry_values.h"

#include "install/src/registry/registry_access.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kValueRoom = 100;  // characters, the terminator included

}  // namespace

Status RegistryValues::open(std::string_view path, AccessMask access, OwnedKey& key) {
    const Status status = registry_.openKey(KeyHandle::localMachine, path, access, key.receive());
    if (!succeeded(status)) {
        tell("Failed to open the registry key:%s", {path});
    }
    return status;
}

std::string RegistryValues::query(std::string_view path, std::string_view name, std::string_view complaint) {
    OwnedKey key(registry_);
    if (!succeeded(open(path, kKeyReadSet, key))) {
        return {};
    }
    // Deliberate: a value that does not fit reads as empty, in a backup of an alias as well; aliases name copies, whose
    // names are shorter.
    TextBuffer<kValueRoom> data;
    if (!succeeded(queryText(registry_, key.get(), name, data))) {
        tell(complaint, {path, name});
        return {};
    }
    return std::string(data.text());
}

std::string RegistryValues::getValue(std::string_view path, std::string_view name) {
    return query(path, name, "Failed to get the value of:%s\\%s");
}

std::string RegistryValues::readValue(std::string_view path, std::string_view name) {
    return query(path, name, "Failed to read the value of:%s\\%s");
}

Status RegistryValues::setValue(std::string_view path, std::string_view name, std::string_view data) {
    OwnedKey key(registry_);
    if (!succeeded(open(path, kKeyFull, key))) {
        return kFailed;
    }
    // Deliberate: stored without a terminating NUL; readers of the aliases expect that.
    return succeeded(registry_.setValue(key.get(), name, ValueType::sz, data)) ? kSuccess : kFailed;
}

Status RegistryValues::deleteValue(std::string_view path, std::string_view name) {
    OwnedKey key(registry_);
    if (!succeeded(open(path, kKeyFull, key))) {
        return kFailed;
    }
    return succeeded(registry_.deleteValue(key.get(), name)) ? kSuccess : kFailed;
}

}  // namespace kz7
