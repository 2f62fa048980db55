// Walks trees of keys in an order that does not depend on the store: keys by their upper-cased names, a key before its
// subkeys; values by their upper-cased names, the default value first.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "install/src/registry/key_name.h"
#include "install/src/registry/key_reader.h"

namespace kz7 {

struct KeyRecord {
    std::string name;       // with its root
    std::size_t depth = 0;  // below the key that the walk began at
    std::string keyClass;
    bool hasSubkeys = false;
    std::vector<KeyValue> values;
    Status status = kSuccess;  // else the key is listed but cannot be read; its subkeys are skipped
};

// A root without values, which every store has.
bool isBareRoot(const KeyRecord& record);

// Any other status than kSuccess ends the walk with that status.
using KeyVisitor = std::function<Status(const KeyRecord&)>;

// The key at which a walk begins, and its class. The last name is spelled as in the store, its parents as the caller
// spelled them.
struct KeyStart {
    KeyName name;
    std::string keyClass;
};

// kFileNotFound: the key does not exist.
Status findKey(IRegistryStore& registry, const KeyName& name, KeyStart& start);

// The keys to show by default: the roots of an embedded store, else the product's keys in the machine's registry.
// Succeeds if none exists.
Status findEverything(IRegistryStore& registry, bool storeIsOwn, std::vector<KeyStart>& starts);

// Visits the key and its subkeys at any depth; a link is visited as a key of its own and is not followed.
// kFileNotFound: the key does not exist. Skips keys that are deleted during the walk.
Status walkKeys(IRegistryStore& registry, const KeyStart& start, const KeyVisitor& visit);

}  // namespace kz7
