#include "install/admin/key_walk.h"

#include <algorithm>

#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr AccessMask kKeyWalk = kKeyQueryValue | kKeyEnumerateSubkeys;
constexpr std::size_t kBytesOfCharacter = 4;  // at most, in any narrow encoding
constexpr std::size_t kRoomLimit = std::size_t{1} << 31;

struct Subkey {
    std::string name;
    std::string keyClass;
};

template <typename Named>
void sortByName(std::vector<Named>& items) {
    std::vector<std::pair<std::string, Named>> keyed;
    for (Named& item : items) {
        std::string fold = foldUpper(item.name);
        keyed.emplace_back(std::move(fold), std::move(item));
    }
    std::stable_sort(keyed.begin(), keyed.end(), [](const auto& a, const auto& b) { return a.first < b.first; });
    for (std::size_t i = 0; i < items.size(); ++i) {
        items[i] = std::move(keyed[i].second);
    }
}

// Keeps its buffers for a whole walk; they grow with the data and classes that it reads.
class Reader {
public:
    explicit Reader(IRegistryStore& registry) : registry_(registry) {}

    Status subkeys(KeyHandle key, std::vector<Subkey>& found) {
        return all(found, class_, [&](std::uint32_t index, Buffer& name, Buffer& keyClass) {
            const Status status = registry_.enumerateKey(key, index, name, &keyClass);
            return std::pair(status, Subkey{std::string(name.view()), std::string(keyClass.view())});
        });
    }

    Status values(KeyHandle key, std::vector<KeyValue>& found) {
        return all(found, data_, [&](std::uint32_t index, Buffer& name, Buffer& data) {
            ValueType type{};
            const Status status = registry_.enumerateValue(key, index, name, &type, &data);
            return std::pair(status, KeyValue{std::string(name.view()), type, std::string(data.view())});
        });
    }

    // Opens a key and reads its values and the names of its subkeys.
    Status key(KeyHandle parent, std::string_view path, OwnedKey& key, std::vector<KeyValue>& values,
               std::vector<Subkey>& subkeys) {
        values.clear();
        Status status = registry_.openKey(parent, path, kKeyWalk | kKeyOpenLink, key.receive());
        if (status == kSuccess) {
            status = this->values(key.get(), values);
        }
        return status == kSuccess ? this->subkeys(key.get(), subkeys) : status;
    }

    // Whether a key still lists a subkey that could not be read. False if the key itself is deleted.
    bool isListed(KeyHandle parent, std::string_view name) {
        std::vector<Subkey> listed;
        const Status status = subkeys(parent, listed);
        return status == kSuccess ? std::any_of(listed.begin(), listed.end(),
                                                [&](const Subkey& subkey) { return subkey.name == name; })
                                  : !isNotFound(status) && status != kKeyDeleted;
    }

private:
    template <typename Item, typename Read>
    Status all(std::vector<Item>& found, std::string& room, Read read) {
        std::vector<Item> items;
        for (;;) {
            Buffer name(name_.data(), static_cast<std::uint32_t>(name_.size()));
            Buffer data(room.data(), static_cast<std::uint32_t>(room.size()));
            auto [status, item] = read(static_cast<std::uint32_t>(items.size()), name, data);
            if (status == kMoreData && room.size() < kRoomLimit) {
                room.resize(std::min(std::max<std::size_t>(2 * room.size(), data.size), kRoomLimit));
            } else if (isEndOfItems(status)) {
                sortByName(items);
                found = std::move(items);
                return kSuccess;
            } else if (status != kSuccess) {
                return status;
            } else {
                items.push_back(std::move(item));
            }
        }
    }

    IRegistryStore& registry_;
    std::string name_ = std::string(kBytesOfCharacter * (kMaxValueName + 1), '\0');
    std::string class_ = std::string(256, '\0');
    std::string data_ = std::string(4096, '\0');
};

// The keys that a path matches, the last name in the store's spelling. kFileNotFound: their parent does not exist.
Status addMatches(IRegistryStore& registry, KeyHandle root, std::string_view path, bool prefix,
                  std::vector<KeyStart>& starts) {
    const std::size_t cut = path.find_last_of('\\') + 1;
    const std::string parent(path.substr(0, cut));
    const std::string last = foldUpper(path.substr(cut));
    OwnedKey key(registry);
    Status status = registry.openKey(root, path.substr(0, cut == 0 ? 0 : cut - 1), kKeyWalk, key.receive());
    std::vector<Subkey> subkeys;
    if (status == kSuccess) {
        status = Reader(registry).subkeys(key.get(), subkeys);
    }
    for (Subkey& subkey : subkeys) {
        const std::string fold = foldUpper(subkey.name);
        if (prefix ? fold.starts_with(last) : fold == last) {
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
    std::vector<KeyStart> found;
    if (status == kSuccess && !name.path.empty()) {
        status = addMatches(registry, name.root, name.path, false, found);
    }
    if (status == kSuccess) {
        // Not found where the host folds more letters than ASCII.
        start = found.empty() ? KeyStart{name, {}} : std::move(found.front());
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
        const bool prefix = path.ends_with('*');
        path.remove_suffix(prefix ? 1 : 0);
        const Status status = addMatches(registry, KeyHandle::localMachine, path, prefix, found);
        if (status != kSuccess && !isNotFound(status)) {
            return status;
        }
    }
    starts = std::move(found);
    return kSuccess;
}

Status walkKeys(IRegistryStore& registry, const KeyStart& start, const KeyVisitor& visit) {
    Reader reader(registry);
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
