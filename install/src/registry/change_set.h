// Change sets: what differs between two states of the registry, as data. The same model is shown before a run, recorded
// during one, taken back and applied again.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "install/platform/history.h"
#include "install/platform/service_manager.h"
#include "install/src/registry/key_walk.h"

namespace kz7 {

// A key that is created or removed, or a value with its state before and after. A removed key's values and subkeys are
// changes of their own.
struct Change {
    enum class Kind { keyCreated, keyRemoved, value };

    Kind kind{};
    std::string key;                   // full name, with its root
    std::string keyClass;              // of a key that is created or removed
    std::string name;                  // of the value; empty for the default value
    std::optional<ValueState> before;  // of the value; none: it does not exist
    std::optional<ValueState> after;

    bool isKey() const { return kind != Kind::value; }
};

// In the order in which the changes can be applied: a key before what is below it, and after it where it is removed.
using ChangeSet = std::vector<Change>;

// Keys in walk order: a key before its subkeys, subkeys and values by their upper-cased names.
using Snapshot = std::vector<KeyRecord>;

// What turns `before` into `after`. A key whose class differs is removed and created again, with all below it: no
// registry can change a class.
ChangeSet difference(const Snapshot& before, const Snapshot& after);

// What takes the changes back.
ChangeSet inverse(ChangeSet changes);

// The changes whose row is not in its state before any more. That of a removed key includes that it has no other values
// and subkeys than those that are removed with it; the run state of a service does not count. On failure `key` names
// the key that cannot be read.
Status findConflicts(IRegistryStore& registry, bool wholeServices, const ChangeSet& changes,
                     std::vector<const Change*>& conflicts, std::string& key);

// Makes the changes, without a commit and without a look at the states before. With `services`, those of services are
// made through that port, and without it they are rows like all others. On failure `key` names the key or service that
// cannot be changed; what comes before it is made.
Status applyChangeSet(IRegistryStore& registry, IServiceManager* services, const ChangeSet& changes, std::string& key);

// Whether a row is the run state of a service, which no one takes back.
bool isRunState(const Change& change);

// The name of the management service whose record the key belongs to; empty for other keys.
std::string_view serviceOf(std::string_view fullKeyName);

// How many services, and keys and values apart from those, a change set changes.
ChangeCounts countChanges(const ChangeSet& changes);

// Reads the keys with everything below them. On failure `key` names the key that cannot be read.
//
// Without `wholeServices`, a service is read as its configuration only: a machine's service manager keeps more in the
// same place, for itself.
Status readSnapshot(IRegistryStore& registry, bool wholeServices, const std::vector<KeyStart>& starts,
                    Snapshot& snapshot, std::string& key);

}  // namespace kz7
