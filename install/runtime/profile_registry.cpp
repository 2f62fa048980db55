#include "install/runtime/profile_registry.h"

#include "install/runtime/guarded.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/copy_name.h"
#include "install/src/registry/registry_access.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kVariableSize = 10000;  // characters of a value with its NUL

Status named(Status status) {
    return isNotFound(status) ? kVariableNotThere : status;
}

std::string profileOf(std::string_view instance) {
    return instance == kGlobalProfile ? "GLOBAL_PROFILE" : "PROFILES\\" + std::string(instance);
}

}  // namespace

ProfileRegistry::ProfileRegistry(IRegistryStore& registry, std::string_view copyName)
    : registry_(registry), copyPath_(substituteCopyName(layout::kCopy, copyName)) {}

std::string ProfileRegistry::keyOf(std::string_view instance) const {
    return copyPath_ + '\\' + profileOf(instance);
}

Status ProfileRegistry::set(std::string_view instance, std::string_view variable, std::string_view value) {
    return guarded([&] {
        return value.empty() ? remove(keyOf(instance), variable) : write(profileOf(instance), variable, value);
    });
}

// Below the open key of the copy: one that is removed meanwhile does not come back.
Status ProfileRegistry::write(const std::string& profile, std::string_view variable, std::string_view value) {
    Status status = checkPathLength(copyPath_ + '\\' + profile);
    OwnedKey copy(registry_);
    if (status == kSuccess) {
        status = registry_.openKey(KeyHandle::localMachine, copyPath_, kKeyCreateSubkey, copy.receive());
    }
    OwnedKey key(registry_);
    if (status == kSuccess) {
        status = registry_.createKey(copy.get(), profile, {}, kKeySetValue, key.receive());
    }
    return status != kSuccess ? status
                              : registry_.setValue(key.get(), variable, ValueType::sz, std::string(value) + '\0');
}

Status ProfileRegistry::remove(const std::string& path, std::string_view variable) {
    OwnedKey key(registry_);
    const Status status = registry_.openKey(KeyHandle::localMachine, path, kKeySetValue, key.receive());
    return named(status != kSuccess ? status : registry_.deleteValue(key.get(), variable));
}

Status ProfileRegistry::settle() {
    return guarded([&] { return registry_.commit(); });
}

Status ProfileRegistry::get(std::string_view instance, std::string_view variable, std::string& value) {
    return guarded([&] { return read(instance, variable, value); });
}

Status ProfileRegistry::read(std::string_view instance, std::string_view variable, std::string& value) {
    OwnedKey key(registry_);
    TextBuffer<kVariableSize> data;
    Status status = registry_.openKey(KeyHandle::localMachine, keyOf(instance), kKeyQueryValue, key.receive());
    if (status == kSuccess) {
        status = queryText(registry_, key.get(), variable, data);
    }
    if (status == kSuccess) {
        value = data.text();
    }
    return named(status);
}

}  // namespace kz7
