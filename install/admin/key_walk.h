// Reading trees of keys, in an order that does not hang on the store: keys by their upper-cased names, a key
// before what is below it; values with the default one first, then by their upper-cased names.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "install/admin/key_name.h"

namespace kz7 {

struct KeyValue {
    std::string name;
    ValueType type = ValueType::none;
    std::string data;
};

struct KeyRecord {
    std::string name;       // with its root in front
    std::size_t depth = 0;  // below the key that the walk began at
    std::string keyClass;
    bool hasSubkeys = false;
    std::vector<KeyValue> values;
    Status status = kSuccess;  // else the key is listed but cannot be read, and nothing below it is visited
};

// A root without values of its own: it is always there and tells nothing.
bool isBareRoot(const KeyRecord& record);

// Anything but kSuccess ends the walk with that status.
using KeyVisitor = std::function<Status(const KeyRecord&)>;

// Where a walk begins: one key, its own name spelled as the store spells it and its parents' as they were
// asked for, and its class.
struct KeyStart {
    KeyName name;
    std::string keyClass;
};

// kFileNotFound: it is not there.
Status findKey(IRegistryStore& registry, const KeyName& name, KeyStart& start);

// What there is to show where no key is named: all of a store of our own, else what the product keeps in the
// machine's registry. None is success.
Status findEverything(IRegistryStore& registry, bool storeIsOwn, std::vector<KeyStart>& starts);

// The key and all below it, however deep; a link is a key of its own and is not followed. kFileNotFound: it is not
// there. A key that is deleted during the walk is left out.
Status walkKeys(IRegistryStore& registry, const KeyStart& start, const KeyVisitor& visit);

}  // namespace kz7
