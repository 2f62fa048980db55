#include "install/src/registry/change_set.h"

#include <algorithm>
#include <array>
#include <map>
#include <set>
#include <unordered_map>

#include "install/platform/service_records.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kServicePrefix = "HKEY_LOCAL_MACHINE\\SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC";

// The values of a service's record that are its configuration.
constexpr std::array<std::string_view, 6> kServiceValues = {"Type",      "Start",       "ErrorControl",
                                                            "ImagePath", "DisplayName", "ObjectName"};
constexpr std::uint32_t kServiceWait = 30'000;  // milliseconds that a service gets to stop or to be gone

std::optional<ValueState> stateOf(const KeyValue* value) {
    return value == nullptr ? std::nullopt : std::optional(ValueState{value->type, value->data});
}

// Calls `visit` with the items of two sorted sequences in order, side by side where they have the same name.
template <typename Item, typename Order, typename Visit>
void merge(const std::vector<Item>& before, const std::vector<Item>& after, Order order, Visit visit) {
    auto left = before.begin();
    auto right = after.begin();
    while (left != before.end() || right != after.end()) {
        int comparison = left == before.end() ? 1 : -1;
        if (left != before.end() && right != after.end()) {
            comparison = order(left->name).compare(order(right->name));
        }
        visit(comparison <= 0 ? &*left : nullptr, comparison >= 0 ? &*right : nullptr);
        left += comparison <= 0 ? 1 : 0;
        right += comparison >= 0 ? 1 : 0;
    }
}

void addValues(const std::string& key, const std::vector<KeyValue>& before, const std::vector<KeyValue>& after,
               ChangeSet& changes) {
    merge(
        before, after, [](const std::string& name) { return foldUpper(name); },
        [&](const KeyValue* left, const KeyValue* right) {
            Change change{Change::Kind::value, key,           {}, left == nullptr ? right->name : left->name,
                          stateOf(left),       stateOf(right)};
            if (change.before != change.after) {
                changes.push_back(std::move(change));
            }
        });
}

// The keys that a walk has met and that are to be removed, as a path from a key to one below it. A key whose class
// differs is removed with everything below it and created again. Each is removed when the walk has left it, so that the
// order does not depend on the keys that are the same.
class RemovedKeys {
public:
    explicit RemovedKeys(ChangeSet& changes) : changes_(changes) {}

    void add(const KeyRecord& key) { keys_.emplace_back(walkPlace(key.name) + '\0', &key); }

    // Begins or goes on to create a key below one that is removed first.
    void createAfter(const KeyRecord& key) { created_.push_back(&key); }

    bool isReplacing() const { return !created_.empty(); }

    // Before the walk goes on with a key; `place` is empty at its end.
    void leaveFor(const std::string& place) {
        for (; !keys_.empty() && !place.starts_with(keys_.back().first); keys_.pop_back()) {
            const KeyRecord& key = *keys_.back().second;
            addValues(key.name, key.values, {}, changes_);
            changes_.push_back({Change::Kind::keyRemoved, key.name, key.keyClass, {}, {}, {}});
        }
        for (auto key = created_.begin(); keys_.empty() && key != created_.end(); ++key) {
            create(**key);
        }
        created_.resize(keys_.empty() ? 0 : created_.size());
    }

    void create(const KeyRecord& key) {
        changes_.push_back({Change::Kind::keyCreated, key.name, key.keyClass, {}, {}, {}});
        addValues(key.name, {}, key.values, changes_);
    }

private:
    ChangeSet& changes_;
    std::vector<std::pair<std::string, const KeyRecord*>> keys_;
    std::vector<const KeyRecord*> created_;
};

KeyName nameOf(const std::string& fullName) {
    KeyName name;
    parseKeyName(fullName, name);
    return name;
}

// Reads rows one after another; rows of one key come together.
class RowReader {
public:
    explicit RowReader(IRegistryStore& registry) : registry_(registry), reader_(registry), key_(registry) {}

    // kFileNotFound: the key does not exist.
    Status open(const std::string& key) {
        if (key_ && key == name_) {
            return kSuccess;
        }
        const KeyName name = nameOf(key);
        name_ = key;
        listed_.reset();
        return registry_.openKey(name.root, name.path, kKeyWalk | kKeyOpenLink, key_.receive());
    }

    // With `all`, all values are read at once: faster where each of them will be asked for.
    Status value(std::string_view name, bool all, std::optional<ValueState>& state) {
        if (!all) {
            return reader_.value(key_.get(), name, state);
        }
        const Status status = list();
        if (status == kSuccess) {
            const auto found = listed_->find(foldUpper(name));
            state = found == listed_->end() ? std::nullopt : std::optional(found->second);
        }
        return status;
    }

    // Whether the open key has exactly that many values and subkeys.
    Status has(std::size_t values, std::size_t subkeys, bool& exactly) {
        std::vector<Subkey> found;
        Status status = list();
        status = status == kSuccess ? reader_.subkeysInOrder(key_.get(), found) : status;
        const auto isCounted = [&](const auto& value) {
            return !isRunState({Change::Kind::value, name_, {}, value.first, {}, {}});
        };
        exactly = status == kSuccess && found.size() == subkeys &&
                  static_cast<std::size_t>(std::count_if(listed_->begin(), listed_->end(), isCounted)) == values;
        return status;
    }

private:
    Status list() {
        std::vector<KeyValue> values;
        const Status status = listed_ ? kSuccess : reader_.valuesInOrder(key_.get(), values);
        if (status == kSuccess && !listed_) {
            listed_.emplace();
            for (KeyValue& value : values) {
                listed_->try_emplace(foldUpper(value.name), ValueState{value.type, std::move(value.data)});
            }
        }
        return status;
    }

    IRegistryStore& registry_;
    KeyReader reader_;
    OwnedKey key_;
    std::string name_;
    std::optional<std::unordered_map<std::string, ValueState>> listed_;  // by folded name
};

// How many values and subkeys of each removed key are removed with it.
struct Content {
    bool isRemoved = false;
    std::size_t values = 0;
    std::size_t subkeys = 0;
};
using Contents = std::map<std::string, Content>;  // by folded key

Contents removedContents(const ChangeSet& changes) {
    Contents contents;
    for (const Change& change : changes) {
        if (change.kind == Change::Kind::keyRemoved) {
            if (const std::size_t end = change.key.find_last_of('\\'); end != std::string::npos) {
                ++contents[foldUpper(change.key.substr(0, end))].subkeys;
            }
            contents[foldUpper(change.key)].isRemoved = true;
        } else if (!change.isKey() && change.before && !isRunState(change)) {
            ++contents[foldUpper(change.key)].values;
        }
    }
    return contents;
}

// The type of a value of a service's configuration. That of the program is chosen by the service manager.
ValueType serviceType(std::string_view name, ValueType found) {
    return equalsIgnoreCase(name, "ImagePath") ? ValueType::expandSz : found;
}

Status isAsBefore(RowReader& reader, const Change& change, const Contents& contents, bool wholeServices,
                  bool& asBefore) {
    const auto found = contents.find(foldUpper(change.key));
    const Content removed = found == contents.end() ? Content{} : found->second;
    if (removed.isRemoved && change.kind != Change::Kind::keyRemoved && !change.before) {
        asBefore = true;  // below a key that is created again
        return kSuccess;
    }
    Status status = reader.open(change.key);
    if (isNotFound(status)) {
        asBefore = change.kind == Change::Kind::keyCreated || (change.kind == Change::Kind::value && !change.before);
        return kSuccess;
    }
    if (status != kSuccess) {
        return status;
    }
    if (change.kind == Change::Kind::keyRemoved) {
        if (!wholeServices && !serviceOf(change.key).empty()) {
            asBefore = true;  // whatever else the service manager keeps there
            return kSuccess;
        }
        return reader.has(removed.values, removed.subkeys, asBefore);
    }
    if (change.kind == Change::Kind::keyCreated) {
        asBefore = false;
        return kSuccess;
    }
    std::optional<ValueState> state;
    status = reader.value(change.name, removed.isRemoved, state);
    if (state && !wholeServices && !serviceOf(change.key).empty()) {
        state->type = serviceType(change.name, state->type);
    }
    asBefore = state == change.before;
    return status;
}

// Changes rows one after another; the key of the values that come together stays open.
class ChangeWriter {
public:
    explicit ChangeWriter(IRegistryStore& registry) : registry_(registry), key_(registry) {}

    Status apply(const Change& change) {
        const KeyName name = nameOf(change.key);
        Status status = kSuccess;
        if (change.isKey() || !key_ || change.key != name_) {
            key_.reset();
            name_ = change.key;
        }
        if (change.kind == Change::Kind::keyRemoved) {
            return registry_.deleteKey(name.root, name.path, 0);
        }
        if (change.kind == Change::Kind::keyCreated) {
            return registry_.createKey(name.root, name.path, change.keyClass, kKeySetValue, key_.receive());
        }
        if (!key_) {
            status = registry_.openKey(name.root, name.path, kKeySetValue | kKeyOpenLink, key_.receive());
        }
        if (status != kSuccess) {
            return status;
        }
        return change.after ? registry_.setValue(key_.get(), change.name, change.after->type, change.after->data)
                            : registry_.deleteValue(key_.get(), change.name);
    }

private:
    IRegistryStore& registry_;
    OwnedKey key_;
    std::string name_;
};

// A removed key takes its values along, so the changes of those before it need not be made one by one.
ChangeSet::const_iterator afterItsValues(ChangeSet::const_iterator change, ChangeSet::const_iterator end) {
    const auto next = std::find_if(
        change, end, [&](const Change& other) { return other.isKey() || other.after || other.key != change->key; });
    return next != end && next->kind == Change::Kind::keyRemoved && next->key == change->key ? next : change;
}

// The values of a service's record that are its configuration, each with what stands for one that is missing.
class ServiceValues {
public:
    void set(std::string_view name, const std::optional<ValueState>& state) {
        if (state) {
            values_[foldUpper(name)] = state->data;
        } else {
            values_.erase(foldUpper(name));
        }
    }
    std::string_view text(std::string_view name) const {
        const auto found = values_.find(foldUpper(name));
        const std::string_view data = found == values_.end() ? std::string_view{} : found->second;
        return data.substr(0, data.find('\0'));
    }
    std::uint32_t number(std::string_view name, std::uint32_t otherwise) const {
        const auto found = values_.find(foldUpper(name));
        std::uint32_t number = 0;
        if (found == values_.end() || found->second.size() != sizeof number) {
            return otherwise;
        }
        for (std::size_t at = sizeof number; at-- > 0;) {
            number = number << 8 | static_cast<unsigned char>(found->second[at]);
        }
        return number;
    }

private:
    std::map<std::string, std::string> values_;  // by folded name
};

struct ServiceChange {
    std::string name;
    bool isCreated = false;
    bool isRemoved = false;
    ServiceValues after;
};

Status removeService(IServiceManager& services, ServiceHandle service) {
    const Status stopped = services.stopService(service);
    if (stopped == kSuccess || stopped == kServiceTakesNoControl) {
        services.waitForStop(service, kServiceWait);
    }
    return services.deleteService(service);
}

Status applyService(IServiceManager& services, const ServiceChange& change) {
    OwnedService manager(services);
    OwnedService service(services);
    const Status status = services.openManager(kServiceManagerAllAccess, manager.receive());
    if (status != kSuccess) {
        return status;
    }
    const auto automatic = static_cast<std::uint32_t>(ServiceStart::automatic);
    const ServiceDefinition definition{.name = change.name,
                                       .displayName = change.after.text("DisplayName"),
                                       .programPath = change.after.text("ImagePath"),
                                       .type = change.after.number("Type", kServiceOwnProcess),
                                       .start = static_cast<ServiceStart>(change.after.number("Start", automatic)),
                                       .errorControl = change.after.number("ErrorControl", kServiceErrorNormal),
                                       .deletionWait = kServiceWait};
    if (change.isCreated) {
        return services.createService(manager.get(), definition, service.receive());
    }
    if (const Status opened = services.openService(manager.get(), change.name, kServiceAllAccess, service.receive());
        opened != kSuccess) {
        return opened;
    }
    return change.isRemoved ? removeService(services, service.get())
                            : services.configureService(service.get(), definition);
}

Status readConfiguration(RowReader& reader, const std::string& key, ServiceValues& values) {
    Status status = reader.open(key);
    for (const std::string_view name : kServiceValues) {
        std::optional<ValueState> state;
        status = status == kSuccess ? reader.value(name, false, state) : status;
        values.set(name, state);
    }
    return status;
}

// The changes of services, each with its whole configuration afterwards.
Status gatherServices(IRegistryStore& registry, const ChangeSet& changes,
                      std::map<std::string, ServiceChange>& gathered, std::string& key) {
    RowReader reader(registry);
    Status status = kSuccess;
    for (auto change = changes.begin(); status == kSuccess && change != changes.end(); ++change) {
        const std::string_view name = serviceOf(change->key);
        if (name.empty()) {
            continue;
        }
        key = change->key;
        const auto [place, isNew] =
            gathered.try_emplace(foldUpper(name), ServiceChange{std::string(name), false, false, {}});
        ServiceChange& service = place->second;
        service.isCreated = service.isCreated || change->kind == Change::Kind::keyCreated;
        service.isRemoved = service.isRemoved || change->kind == Change::Kind::keyRemoved;
        if (isNew && !service.isCreated) {
            status = readConfiguration(reader, change->key, service.after);
        }
        if (!change->isKey()) {
            service.after.set(change->name, change->after);
        }
    }
    return status;
}

bool isServiceValue(std::string_view name) {
    return std::any_of(kServiceValues.begin(), kServiceValues.end(),
                       [&](std::string_view value) { return equalsIgnoreCase(value, name); });
}

}  // namespace

ChangeSet difference(const Snapshot& before, const Snapshot& after) {
    ChangeSet changes;
    RemovedKeys removed(changes);
    merge(before, after, walkPlace, [&](const KeyRecord* left, const KeyRecord* right) {
        removed.leaveFor(walkPlace(left == nullptr ? right->name : left->name));
        const bool isReplaced =
            left != nullptr && right != nullptr && (removed.isReplacing() || left->keyClass != right->keyClass);
        if (left != nullptr && (right == nullptr || isReplaced)) {
            removed.add(*left);
        }
        if (right != nullptr && (isReplaced || removed.isReplacing())) {
            removed.createAfter(*right);
        } else if (left == nullptr) {
            removed.create(*right);
        } else if (right != nullptr) {
            addValues(right->name, left->values, right->values, changes);
        }
    });
    removed.leaveFor({});
    return changes;
}

ChangeSet inverse(ChangeSet changes) {
    std::reverse(changes.begin(), changes.end());
    for (Change& change : changes) {
        std::swap(change.before, change.after);
        if (change.isKey()) {
            change.kind = change.kind == Change::Kind::keyCreated ? Change::Kind::keyRemoved : Change::Kind::keyCreated;
        }
    }
    return changes;
}

Status findConflicts(IRegistryStore& registry, bool wholeServices, const ChangeSet& changes,
                     std::vector<const Change*>& conflicts, std::string& key) {
    const Contents contents = removedContents(changes);
    RowReader reader(registry);
    for (const Change& change : changes) {
        bool asBefore = false;
        if (const Status status = isAsBefore(reader, change, contents, wholeServices, asBefore); status != kSuccess) {
            key = change.key;
            return status;
        }
        if (!asBefore) {
            conflicts.push_back(&change);
        }
    }
    return kSuccess;
}

Status applyChangeSet(IRegistryStore& registry, IServiceManager* services, const ChangeSet& changes, std::string& key) {
    std::map<std::string, ServiceChange> ofServices;
    Status status = services == nullptr ? kSuccess : gatherServices(registry, changes, ofServices, key);
    ChangeWriter writer(registry);
    for (auto change = changes.begin(); status == kSuccess && change != changes.end(); ++change) {
        if (services == nullptr || serviceOf(change->key).empty()) {
            change = key == change->key ? change : afterItsValues(change, changes.end());
            key = change->key;
            status = writer.apply(*change);
        }
    }
    for (auto service = ofServices.begin(); status == kSuccess && service != ofServices.end(); ++service) {
        key = service->second.name;
        status = applyService(*services, service->second);
    }
    return status;
}

bool isRunState(const Change& change) {
    return !change.isKey() && equalsIgnoreCase(change.name, kServiceRunState) && !serviceOf(change.key).empty();
}

std::string_view serviceOf(std::string_view fullKeyName) {
    if (!equalsIgnoreCase(fullKeyName.substr(0, kServicePrefix.size()), kServicePrefix)) {
        return {};
    }
    const std::string_view name = fullKeyName.substr(kServicePrefix.find_last_of('\\') + 1);
    return name.substr(0, name.find('\\'));
}

ChangeCounts countChanges(const ChangeSet& changes) {
    ChangeCounts counts;
    std::set<std::string> services;
    for (const Change& change : changes) {
        if (const std::string_view service = serviceOf(change.key); !service.empty()) {
            services.insert(foldUpper(service));
        } else {
            ++(change.isKey() ? counts.keys : counts.values);
        }
    }
    counts.services = services.size();
    return counts;
}

Status readSnapshot(IRegistryStore& registry, bool wholeServices, const std::vector<KeyStart>& starts,
                    Snapshot& snapshot, std::string& key) {
    const auto add = [&](const KeyRecord& record) {
        key = record.name;
        const std::string_view service = serviceOf(record.name);
        if (wholeServices || service.empty() || record.status != kSuccess) {
            snapshot.push_back(record);
        } else if (record.name.ends_with(service)) {
            snapshot.push_back(record);
            auto& values = snapshot.back().values;
            std::erase_if(values, [](const KeyValue& value) { return !isServiceValue(value.name); });
            for (KeyValue& value : values) {
                value.type = serviceType(value.name, value.type);
            }
        }
        return record.status;
    };
    for (const KeyStart& start : starts) {
        key = fullKeyName(start.name);
        if (const Status status = walkKeys(registry, start, add); status != kSuccess) {
            return status;
        }
    }
    return kSuccess;
}

}  // namespace kz7
