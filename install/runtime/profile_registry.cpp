#include "install/runtime/profile_registry.h"

#include "install/src/registry/copy_layout.h"
#include "install/src/registry/copy_name.h"
#include "install/src/registry/registry_access.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kVariableSize = 10000;  // bytes of a value with its NUL

Status named(Status status) {
    return isNotFound(status) ? kVariableNotThere : status;
}

}  // namespace

std::string ProfileRegistry::keyOf(std::string_view instance) const {
    const std::string copy = substituteCopyName(layout::kCopy, copyName_);
    return instance == kGlobalProfile ? copy + "\\GLOBAL_PROFILE" : copy + "\\PROFILES\\" + std::string(instance);
}

Status ProfileRegistry::set(std::string_view instance, std::string_view variable, std::string_view value) {
    const std::string key = keyOf(instance);
    return value.empty() ? remove(key, variable) : setText(registry_, key, variable, value);
}

Status ProfileRegistry::remove(const std::string& path, std::string_view variable) {
    OwnedKey key(registry_);
    const Status status = registry_.openKey(KeyHandle::localMachine, path, kKeySetValue, key.receive());
    return named(status != kSuccess ? status : registry_.deleteValue(key.get(), variable));
}

Status ProfileRegistry::get(std::string_view instance, std::string_view variable, std::string& value) {
    OwnedKey key(registry_);
    FixedBuffer<kVariableSize> data;
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
