// Reads whole keys: all values, all subkeys, data of any size. Its buffers are used for many keys and grow as needed.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "install/platform/registry_store.h"

namespace kz7 {

inline constexpr AccessMask kKeyWalk = kKeyQueryValue | kKeyEnumerateSubkeys;

struct ValueState {
    ValueType type = ValueType::none;
    std::string data;

    // The data up to the first NUL.
    std::string_view text() const { return std::string_view(data).substr(0, data.find('\0')); }

    bool operator==(const ValueState&) const = default;
};

struct KeyValue {
    std::string name;
    ValueType type = ValueType::none;
    std::string data;
};

struct Subkey {
    std::string name;
    std::string keyClass;
};

class KeyReader {
public:
    explicit KeyReader(IRegistryStore& registry) : registry_(registry) {}

    // Sorted by upper-cased name. Nothing is written on failure.
    Status subkeys(KeyHandle key, std::vector<Subkey>& found);
    Status values(KeyHandle key, std::vector<KeyValue>& found);

    // The same in registry order.
    Status subkeysInOrder(KeyHandle key, std::vector<Subkey>& found);
    Status valuesInOrder(KeyHandle key, std::vector<KeyValue>& found);

    // Opens a key, not what it may link to, and reads its values and the names of its subkeys.
    Status key(KeyHandle parent, std::string_view path, OwnedKey& key, std::vector<KeyValue>& values,
               std::vector<Subkey>& subkeys);

    // One subkey as the store spells it. kFileNotFound: none has that name.
    Status subkey(KeyHandle key, std::string_view name, Subkey& found);

    // Whether a key still lists a subkey that could not be read. False if the key itself is deleted.
    bool isListed(KeyHandle key, std::string_view name);

    // None if the key has no such value.
    Status value(KeyHandle key, std::string_view name, std::optional<ValueState>& state);

private:
    template <typename Read>
    Status grow(std::string& room, Read read);
    template <typename Item, typename Read>
    Status all(std::vector<Item>& found, Read read);
    Status subkeyAt(KeyHandle key, std::uint32_t index, Subkey& found);
    Status valueAt(KeyHandle key, std::uint32_t index, KeyValue& found);

    IRegistryStore& registry_;
    std::string name_ = std::string(1024, '\0');
    std::string class_ = std::string(256, '\0');
    std::string data_ = std::string(4096, '\0');
};

}  // namespace kz7
