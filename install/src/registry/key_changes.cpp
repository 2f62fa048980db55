#include "install/src/registry/key_changes.h"

namespace kz7 {
namespace {

// Descends along the first subkeys without recursion: the cost is linear in the number of keys at any depth.
Status deleteKeys(IRegistryStore& registry, const KeyName& name) {
    struct Level {
        OwnedKey key;
        std::string name;  // below the level above it
    };
    std::vector<Level> levels;
    const auto enter = [&](KeyHandle parent, std::string path) {
        Level level{OwnedKey(registry), std::move(path)};
        const Status status =
            registry.openKey(parent, level.name, kKeyEnumerateSubkeys | kKeyOpenLink, level.key.receive());
        if (status == kSuccess) {
            levels.push_back(std::move(level));
        }
        return status;
    };
    TextBuffer<kMaxKeyName + 1> subkey;
    Status status = enter(name.root, name.path);
    while (status == kSuccess && !levels.empty()) {
        status = registry.enumerateKey(levels.back().key.get(), 0, subkey, nullptr);
        if (status == kSuccess) {
            status = enter(levels.back().key.get(), std::string(subkey.view()));
        } else if (isEndOfItems(status)) {
            const std::string last = std::move(levels.back().name);
            levels.pop_back();
            status = registry.deleteKey(levels.empty() ? name.root : levels.back().key.get(), last, 0);
        }
    }
    return isNotFound(status) && levels.empty() ? kSuccess : status;
}

Status changeValue(IRegistryStore& registry, KeyHandle key, const ValueChange& change) {
    if (!change.remove) {
        return registry.setValue(key, change.name, change.type, change.data);
    }
    const Status status = registry.deleteValue(key, change.name);
    return isNotFound(status) ? kSuccess : status;
}

}  // namespace

Status applyChanges(IRegistryStore& registry, const std::vector<KeyChange>& changes, std::uint32_t& line) {
    for (const KeyChange& change : changes) {
        OwnedKey key(registry);
        Status status = change.remove ? deleteKeys(registry, change.name)
                                      : registry.createKey(change.name.root, change.name.path, change.keyClass,
                                                           kKeySetValue, key.receive());
        if (status != kSuccess) {
            line = change.line;
            return status;
        }
        for (const ValueChange& value : change.values) {
            status = changeValue(registry, key.get(), value);
            if (status != kSuccess) {
                line = value.line;
                return status;
            }
        }
    }
    return kSuccess;
}

}  // namespace kz7
