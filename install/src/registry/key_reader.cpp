#include "install/src/registry/key_reader.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::size_t kRoomLimit = std::size_t{1} << 31;
constexpr std::size_t kNameRoom = kBytesOfCharacter * std::size_t{kMaxValueName + 1};

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

}  // namespace

// Calls `read` with more room until its data fit.
template <typename Read>
Status KeyReader::grow(std::string& room, Read read) {
    for (;;) {
        Buffer data(room.data(), static_cast<std::uint32_t>(room.size()));
        const Status status = read(data);
        if (status != kMoreData || room.size() >= kRoomLimit) {
            return status;
        }
        // The name may be what does not fit.
        name_.resize(kNameRoom);
        room.resize(std::min(std::max<std::size_t>(2 * room.size(), data.size), kRoomLimit));
    }
}

template <typename Item, typename Read>
Status KeyReader::all(std::vector<Item>& found, Read read) {
    std::vector<Item> items;
    Item item;
    Status status = kSuccess;
    while ((status = read(static_cast<std::uint32_t>(items.size()), item)) == kSuccess) {
        items.push_back(std::move(item));
    }
    if (!isEndOfItems(status)) {
        return status;
    }
    found = std::move(items);
    return kSuccess;
}

Status KeyReader::subkeyAt(KeyHandle key, std::uint32_t index, Subkey& found) {
    return grow(class_, [&](Buffer& keyClass) {
        Buffer name(name_.data(), static_cast<std::uint32_t>(name_.size()));
        const Status status = registry_.enumerateKey(key, index, name, &keyClass);
        found = {std::string(name.view()), std::string(keyClass.view())};
        return status;
    });
}

Status KeyReader::valueAt(KeyHandle key, std::uint32_t index, KeyValue& found) {
    return grow(data_, [&](Buffer& data) {
        Buffer name(name_.data(), static_cast<std::uint32_t>(name_.size()));
        ValueType type{};
        const Status status = registry_.enumerateValue(key, index, name, &type, &data);
        found = {std::string(name.view()), type, std::string(data.view())};
        return status;
    });
}

Status KeyReader::subkeys(KeyHandle key, std::vector<Subkey>& found) {
    const Status status = subkeysInOrder(key, found);
    if (status == kSuccess) {
        sortByName(found);
    }
    return status;
}

Status KeyReader::subkeysInOrder(KeyHandle key, std::vector<Subkey>& found) {
    return all(found, [&](std::uint32_t index, Subkey& subkey) { return subkeyAt(key, index, subkey); });
}

Status KeyReader::values(KeyHandle key, std::vector<KeyValue>& found) {
    const Status status = valuesInOrder(key, found);
    if (status == kSuccess) {
        sortByName(found);
    }
    return status;
}

Status KeyReader::valuesInOrder(KeyHandle key, std::vector<KeyValue>& found) {
    return all(found, [&](std::uint32_t index, KeyValue& value) { return valueAt(key, index, value); });
}

Status KeyReader::key(KeyHandle parent, std::string_view path, OwnedKey& key, std::vector<KeyValue>& values,
                      std::vector<Subkey>& subkeys) {
    values.clear();
    Status status = registry_.openKey(parent, path, kKeyWalk | kKeyOpenLink, key.receive());
    if (status == kSuccess) {
        status = this->values(key.get(), values);
    }
    return status == kSuccess ? this->subkeys(key.get(), subkeys) : status;
}

Status KeyReader::subkey(KeyHandle key, std::string_view name, Subkey& found) {
    Status status = kSuccess;
    for (std::uint32_t index = 0; (status = subkeyAt(key, index, found)) == kSuccess; ++index) {
        if (equalsIgnoreCase(found.name, name)) {
            return kSuccess;
        }
    }
    return isEndOfItems(status) ? kFileNotFound : status;
}

bool KeyReader::isListed(KeyHandle key, std::string_view name) {
    Subkey found;
    const Status status = subkey(key, name, found);
    return status == kSuccess || (!isNotFound(status) && status != kKeyDeleted);
}

Status KeyReader::value(KeyHandle key, std::string_view name, std::optional<ValueState>& state) {
    const Status status = grow(data_, [&](Buffer& data) {
        ValueType type{};
        const Status read = registry_.queryValue(key, name, &type, data);
        state = read == kSuccess ? std::optional(ValueState{type, std::string(data.view())}) : std::nullopt;
        return read;
    });
    return isNotFound(status) ? kSuccess : status;
}

}  // namespace kz7
