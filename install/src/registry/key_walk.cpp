#include "install/src/registry/key_walk.h"

#include <algorithm>

#include "install/platform/text.h"
#include "install/src/registry/key_reader.h"

namespace kz7 {
namespace {

// The keys whose name begins with the last name of a path, in the store's spelling. kFileNotFound: their parent does
// not exist.
Status addMatches(IRegistryStore& registry, KeyHandle root, std::string_view path, std::vector<KeyStart>& starts) {
    const std::size_t cut = path.find_last_of('\\') + 1;
    const std::string parent(path.substr(0, cut));
    const std::string prefix = foldUpper(path.substr(cut));
    OwnedKey key(registry);
    Status status = registry.openKey(root, path.substr(0, cut == 0 ? 0 : cut - 1), kKeyWalk, key.receive());
    std::vector<Subkey> subkeys;
    if (status == kSuccess) {
        status = KeyReader(registry).subkeys(key.get(), subkeys);
    }
    for (Subkey& subkey : subkeys) {
        if (foldUpper(subkey.name).starts_with(prefix)) {
            starts.push_back({{root, parent + subkey.name}, std::move(subkey.keyClass)});
        }
    }
    return status;
}

struct Level {
    OwnedKey key;
    std::vector<Subkey> subkeys;
    std::size_t next = 0;
    std::size_t nameSize = 0;  // of the key's full name
};

}  // namespace

bool isBareRoot(const KeyRecord& record) {
    return record.values.empty() && record.name.find('\\') == std::string::npos;
}

Status findKey(IRegistryStore& registry, const KeyName& name, KeyStart& start) {
    OwnedKey key(registry);
    Status status = registry.openKey(name.root, name.path, kKeyWalk | kKeyOpenLink, key.receive());
    if (status != kSuccess || name.path.empty()) {
        start = status == kSuccess ? KeyStart{name, {}} : start;
        return status;
    }
    const std::size_t cut = name.path.find_last_of('\\') + 1;
    Subkey found;
    status = registry.openKey(name.root, name.path.substr(0, cut == 0 ? 0 : cut - 1), kKeyWalk, key.receive());
    if (status == kSuccess) {
        status = KeyReader(registry).subkey(key.get(), std::string_view(name.path).substr(cut), found);
    }
    if (isNotFound(status)) {
        // The host folds more letters than ASCII.
        start = {name, {}};
        return kSuccess;
    }
    if (status == kSuccess) {
        start = {{name.root, name.path.substr(0, cut) + found.name}, std::move(found.keyClass)};
    }
    return status;
}

Status findEverything(IRegistryStore& registry, bool storeIsOwn, std::vector<KeyStart>& starts) {
    if (storeIsOwn) {
        starts = {{{KeyHandle::localMachine, {}}, {}}, {{KeyHandle::users, {}}, {}}};
        return kSuccess;
    }
    std::vector<KeyStart> found;
    for (std::string_view path : kProductKeys) {
        Status status = kSuccess;
        if (path.ends_with('*')) {
            path.remove_suffix(1);
            status = addMatches(registry, KeyHandle::localMachine, path, found);
        } else if (KeyStart start;
                   (status = findKey(registry, {KeyHandle::localMachine, std::string(path)}, start)) == kSuccess) {
            found.push_back(std::move(start));
        }
        if (status != kSuccess && !isNotFound(status)) {
            return status;
        }
    }
    starts = std::move(found);
    return kSuccess;
}

Status walkKeys(IRegistryStore& registry, const KeyStart& start, const KeyVisitor& visit) {
    KeyReader reader(registry);
    KeyRecord record;
    record.name = fullKeyName(start.name);
    record.keyClass = start.keyClass;
    std::vector<Level> levels;
    const auto enter = [&](KeyHandle parent, std::string_view path) {
        Level level{OwnedKey(registry), {}, 0, record.name.size()};
        record.depth = levels.size();
        record.status = reader.key(parent, path, level.key, record.values, level.subkeys);
        record.hasSubkeys = !level.subkeys.empty();
        if (record.status != kSuccess && (levels.empty() || !reader.isListed(parent, path))) {
            return levels.empty() ? record.status : kSuccess;
        }
        const Status status = visit(record);
        if (status == kSuccess && record.status == kSuccess) {
            levels.push_back(std::move(level));
        }
        return status;
    };
    Status status = enter(start.name.root, start.name.path);
    while (status == kSuccess && !levels.empty()) {
        Level& level = levels.back();
        record.name.resize(level.nameSize);
        if (level.next == level.subkeys.size()) {
            levels.pop_back();
            continue;
        }
        Subkey& subkey = level.subkeys[level.next++];
        record.name.append(1, '\\').append(subkey.name);
        record.keyClass = std::move(subkey.keyClass);
        status = enter(level.key.get(), subkey.name);
    }
    return status;
}

}  // namespace kz7
