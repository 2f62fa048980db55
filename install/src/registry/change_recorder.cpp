#include "install/src/registry/change_recorder.h"

#include <utility>

#include "install/platform/assembly_records.h"
#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

KeyName parentOf(const KeyName& name) {
    const std::size_t end = name.path.find_last_of('\\');
    return {name.root, end == std::string::npos ? std::string{} : name.path.substr(0, end)};
}

bool isRoot(KeyHandle key) {
    return key == KeyHandle::localMachine || key == KeyHandle::users || key == KeyHandle::currentUser;
}

}  // namespace

ChangeSet ChangeRecorder::changes() const {
    Snapshot before;
    Snapshot now;
    for (const auto& [place, key] : keys_) {
        KeyRecord was;
        was.name = key.name;
        KeyRecord is = was;
        was.keyClass = key.classBefore;
        is.keyClass = key.classNow;
        for (const auto& [fold, value] : key.values) {
            if (value.before) {
                was.values.push_back({value.name, value.before->type, value.before->data});
            }
            if (value.now) {
                is.values.push_back({value.name, value.now->type, value.now->data});
            }
        }
        if (key.before) {
            before.push_back(std::move(was));
        }
        if (key.now) {
            now.push_back(std::move(is));
        }
    }
    return difference(before, now);
}

// The values of a key that exists, as they are before the run touches them.
void ChangeRecorder::Key::noteValues(const std::vector<KeyValue>& existing) {
    for (const KeyValue& value : existing) {
        const ValueState state{value.type, value.data};
        values.try_emplace(foldUpper(value.name), Value{value.name, state, state});
    }
}

void ChangeRecorder::Key::remove() {
    now = false;
    for (auto& [fold, value] : values) {
        value.now.reset();
    }
}

// Names and classes as the store has them. The last name of a key that does not exist is taken as it is given.
ChangeRecorder::Spelling ChangeRecorder::spell(const KeyName& name, bool exists) {
    Spelling spelling{fullKeyName({name.root, {}}), {}};
    std::string_view rest = name.path;
    std::size_t end = 0;  // of the parent in the path
    for (std::string_view part; takeName(rest, part);) {
        const KeyName parent{name.root, name.path.substr(0, end)};
        end += part.size() + (end == 0 ? 0 : 1);
        const auto [known, isNew] = spelled_.try_emplace(walkPlace(spelling.name + '\\' + std::string(part)));
        if (isNew) {
            Subkey found{std::string(part), {}};
            if (!rest.empty() || exists) {
                OwnedKey key(registry_);
                Status status = registry_.openKey(parent.root, parent.path, kKeyWalk | kKeyOpenLink, key.receive());
                status = status == kSuccess ? reader_.subkey(key.get(), part, found) : status;
                keep(isNotFound(status) ? kSuccess : status);
                if (status != kSuccess) {
                    found = {std::string(part), {}};
                }
            }
            known->second = {spelling.name + '\\' + found.name, std::move(found.keyClass)};
        }
        spelling = known->second;
    }
    return spelling;
}

ChangeRecorder::Key& ChangeRecorder::note(const KeyName& name, bool exists) {
    const auto [place, isNew] = keys_.try_emplace(walkPlace(fullKeyName(name)));
    Key& key = place->second;
    if (isNew) {
        Spelling spelling = spell(name, exists);
        key.name = std::move(spelling.name);
        key.classBefore = key.classNow = spelling.keyClass;
        key.before = key.now = exists;
    }
    return key;
}

bool ChangeRecorder::exists(const KeyName& name) {
    const auto known = keys_.find(walkPlace(fullKeyName(name)));
    if (known != keys_.end()) {
        return known->second.now;
    }
    OwnedKey key(registry_);
    const Status status = registry_.openKey(name.root, name.path, kKeyQueryValue | kKeyOpenLink, key.receive());
    keep(isNotFound(status) ? kSuccess : status);
    return !isNotFound(status);
}

void ChangeRecorder::beforeCreate(const KeyName& name) {
    missing_ = {name};
    for (KeyName key = parentOf(name); !key.path.empty() && !exists(key); key = parentOf(key)) {
        missing_.push_back(key);
    }
    for (auto key = missing_.rbegin(); key != missing_.rend(); ++key) {
        note(*key, false);
    }
}

void ChangeRecorder::created(const KeyName& name, std::string_view keyClass) {
    for (const KeyName& key : std::exchange(missing_, {})) {
        Key& missing = note(key, false);
        missing.now = true;
        missing.classNow.clear();
    }
    note(name, false).classNow = keyClass;
}

// Notes the values of a key that exists.
void ChangeRecorder::list(const KeyName& name, Key& key) {
    if (std::exchange(key.isListed, true)) {
        return;
    }
    OwnedKey opened(registry_);
    std::vector<KeyValue> values;
    Status status = registry_.openKey(name.root, name.path, kKeyWalk | kKeyOpenLink, opened.receive());
    status = status == kSuccess ? reader_.values(opened.get(), values) : status;
    keep(status);
    key.noteValues(values);
}

void ChangeRecorder::beforeDelete(const KeyName& name) {
    rest();
    if (!exists(name)) {
        return;
    }
    list(name, note(name, true));
}

void ChangeRecorder::deleted(const KeyName& name) {
    note(name, true).remove();
}

void ChangeRecorder::beforeValue(const KeyName& name, std::string_view value) {
    Key& key = note(name, true);
    if (key.isListed || !key.before || key.values.contains(foldUpper(value))) {
        return;
    }
    Status status = kSuccess;
    if (!open_ || openName_ != key.name) {
        openName_ = key.name;
        status = registry_.openKey(name.root, name.path, kKeyQueryValue | kKeyOpenLink, open_.receive());
    }
    std::optional<ValueState> state;
    status = status == kSuccess ? reader_.value(open_.get(), value, state) : status;
    keep(status);
    if (state) {
        // The only way to find out how the store spells the name.
        list(name, key);
    } else {
        key.values.try_emplace(foldUpper(value), Value{std::string(value), {}, {}});
    }
}

void ChangeRecorder::valueSet(const KeyName& name, std::string_view value, std::optional<ValueState> state) {
    auto& values = note(name, true).values;
    values.try_emplace(foldUpper(value), Value{std::string(value), {}, {}}).first->second.now = std::move(state);
}

void ChangeRecorder::beforeTree(const KeyName& name) {
    rest();
    if (!exists(name)) {
        beforeCreate(name);
        return;
    }
    missing_.clear();
    KeyStart start;
    Snapshot tree;
    std::string unread;
    Status status = findKey(registry_, name, start);
    status = status == kSuccess ? readSnapshot(registry_, wholeServices_, {start}, tree, unread) : status;
    keep(status);
    for (const KeyRecord& record : tree) {
        const auto [place, isNew] = keys_.try_emplace(walkPlace(record.name));
        Key& key = place->second;
        if (isNew) {
            key.name = record.name;
            key.classBefore = key.classNow = record.keyClass;
            key.before = key.now = true;
        }
        key.isListed = true;
        key.noteValues(record.values);
    }
}

// As if a key and everything below it were gone.
void ChangeRecorder::forgetTree(const KeyName& name) {
    const std::string place = walkPlace(fullKeyName(name));
    for (auto key = keys_.lower_bound(place); key != keys_.end() && key->first.starts_with(place); ++key) {
        if (key->first.size() == place.size() || key->first[place.size()] == '\0') {
            key->second.remove();
        }
    }
}

void ChangeRecorder::afterTree(const KeyName& name, bool isDeleted) {
    forgetTree(name);
    OwnedKey opened(registry_);
    for (const KeyName& key : std::exchange(missing_, {})) {
        note(key, false).now =
            registry_.openKey(key.root, key.path, kKeyQueryValue | kKeyOpenLink, opened.receive()) == kSuccess;
    }
    if (isDeleted) {
        return;
    }
    // Its name is known: a search among all services for each of them would take quadratic time.
    const Key& top = note(name, false);
    KeyStart start{name, top.classNow};
    parseKeyName(top.name, start.name);
    Snapshot tree;
    std::string unread;
    const Status status = readSnapshot(registry_, wholeServices_, {start}, tree, unread);
    keep(isNotFound(status) ? kSuccess : status);
    for (const KeyRecord& record : tree) {
        Key& key = keys_[walkPlace(record.name)];
        key.name = key.name.empty() ? record.name : key.name;
        key.classNow = record.keyClass;
        key.now = true;
        for (const KeyValue& value : record.values) {
            key.values.try_emplace(foldUpper(value.name), Value{value.name, {}, {}}).first->second.now =
                ValueState{value.type, value.data};
        }
    }
}

// Knows the name of every open key.
class RecordedPorts::Registry final : public IRegistryStore {
public:
    Registry(IRegistryStore& real, ChangeRecorder& recorder, bool holdsCommits)
        : real_(real), recorder_(recorder), holdsCommits_(holdsCommits) {}

    Status openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) override {
        const KeyName name = nameOf(parent, path, access);
        return opened(real_.openKey(parent, path, access, key), name, key);
    }
    Status createKey(KeyHandle parent, std::string_view path, std::string_view keyClass, AccessMask access,
                     KeyHandle& key) override {
        const KeyName name = nameOf(parent, path, access);
        Status status = real_.openKey(parent, path, access, key);
        if (isNotFound(status)) {
            recorder_.beforeCreate(name);
            status = real_.createKey(parent, path, keyClass, access, key);
            if (status == kSuccess) {
                recorder_.created(name, keyClass);
            }
        } else if (status != kSuccess) {
            const Status unread = status;
            status = real_.createKey(parent, path, keyClass, access, key);
            recorder_.keep(status == kSuccess ? unread : kSuccess);
        }
        return opened(status, name, key);
    }
    Status closeKey(KeyHandle key) override {
        open_.erase(key);
        return real_.closeKey(key);
    }
    Status queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) override {
        return real_.queryValue(key, name, type, data);
    }
    Status setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) override {
        const KeyName of = nameOf(key, {}, 0);
        recorder_.beforeValue(of, name);
        const Status status = real_.setValue(key, name, type, data);
        if (status == kSuccess) {
            recorder_.valueSet(of, name, ValueState{type, std::string(data)});
        }
        return status;
    }
    Status deleteValue(KeyHandle key, std::string_view name) override {
        const KeyName of = nameOf(key, {}, 0);
        recorder_.beforeValue(of, name);
        const Status status = real_.deleteValue(key, name);
        if (status == kSuccess) {
            recorder_.valueSet(of, name, std::nullopt);
        }
        return status;
    }
    Status enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) override {
        return real_.enumerateKey(key, index, name, keyClass);
    }
    Status enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type, Buffer* data) override {
        return real_.enumerateValue(key, index, name, type, data);
    }
    Status deleteKey(KeyHandle parent, std::string_view path, AccessMask view) override {
        const KeyName name = nameOf(parent, path, view);
        recorder_.beforeDelete(name);
        const Status status = real_.deleteKey(parent, path, view);
        if (status == kSuccess) {
            recorder_.deleted(name);
        }
        return status;
    }
    Status commit() override {
        recorder_.rest();
        const Status status = holdsCommits_ ? kSuccess : real_.commit();
        if (status == kSuccess && !holdsCommits_) {
            committed_ = recorder_.changes();
        }
        return status;
    }

    ChangeSet changes() const { return holdsCommits_ ? recorder_.changes() : committed_; }

private:
    KeyName nameOf(KeyHandle parent, std::string_view path, AccessMask access) const {
        KeyName name{parent, {}};
        if (const auto open = open_.find(parent); open != open_.end()) {
            name = open->second;
        }
        const std::string plain = plainKeyPath(parent, path, access);
        std::string_view rest = plain;
        for (std::string_view part; takeName(rest, part);) {
            name.path.append(name.path.empty() ? "" : "\\").append(part);
        }
        return name;
    }
    Status opened(Status status, const KeyName& name, const KeyHandle& key) {
        if (status == kSuccess && !isRoot(key)) {
            open_.insert_or_assign(key, name);
        }
        return status;
    }

    IRegistryStore& real_;
    ChangeRecorder& recorder_;
    bool holdsCommits_;
    ChangeSet committed_;
    std::map<KeyHandle, KeyName> open_;
};

// A service is recorded as the key of its record, which every service manager keeps in the same place.
class RecordedPorts::Services final : public IServiceManager {
public:
    Services(IServiceManager& real, ChangeRecorder& recorder) : real_(real), recorder_(recorder) {}

    Status openManager(std::uint32_t access, ServiceHandle& manager) override {
        return real_.openManager(access, manager);
    }
    Status createService(ServiceHandle manager, const ServiceDefinition& definition, ServiceHandle& service) override {
        const Status status =
            change(definition.name, false, [&] { return real_.createService(manager, definition, service); });
        return opened(status, definition.name, service);
    }
    Status openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                       ServiceHandle& service) override {
        return opened(real_.openService(manager, name, access, service), name, service);
    }
    Status changeStartType(ServiceHandle service, ServiceStart start) override {
        return change(open_[service], false, [&] { return real_.changeStartType(service, start); });
    }
    Status configureService(ServiceHandle service, const ServiceDefinition& definition) override {
        return change(open_[service], false, [&] { return real_.configureService(service, definition); });
    }
    Status startService(ServiceHandle service) override {
        return change(open_[service], false, [&] { return real_.startService(service); });
    }
    Status stopService(ServiceHandle service) override {
        return change(open_[service], false, [&] { return real_.stopService(service); });
    }
    Status waitForStop(ServiceHandle service, std::uint32_t milliseconds) override {
        return real_.waitForStop(service, milliseconds);
    }
    Status queryState(ServiceHandle service, ServiceState& state) override { return real_.queryState(service, state); }
    Status deleteService(ServiceHandle service) override {
        return change(open_[service], true, [&] { return real_.deleteService(service); });
    }
    Status closeHandle(ServiceHandle handle) override {
        open_.erase(handle);
        return real_.closeHandle(handle);
    }

private:
    template <typename Call>
    Status change(std::string_view name, bool isDeletion, Call call) {
        if (!isServiceName(name)) {
            return call();
        }
        const KeyName key{KeyHandle::localMachine, std::string(kServiceKeys) + std::string(name)};
        recorder_.beforeTree(key);
        const Status status = call();
        // The key of a deleted service may stay for as long as a handle is open.
        recorder_.afterTree(key, isDeletion && status == kSuccess);
        return status;
    }
    Status opened(Status status, std::string_view name, const ServiceHandle& service) {
        if (status == kSuccess) {
            open_.insert_or_assign(service, std::string(name));
        }
        return status;
    }

    IServiceManager& real_;
    ChangeRecorder& recorder_;
    std::map<ServiceHandle, std::string> open_;  // names
};

// Writes to the registry only where that holds the cache's records.
class RecordedPorts::Assemblies final : public IAssemblyCache {
public:
    Assemblies(IAssemblyCache& real, ChangeRecorder& recorder) : real_(real), recorder_(recorder) {}

    Status deregisterProviders(std::string_view level) override {
        return change([&] { return real_.deregisterProviders(level); });
    }
    Status registerProviders(std::string_view location, std::string_view level,
                             FrameworkGenerations generations) override {
        return change([&] { return real_.registerProviders(location, level, generations); });
    }

private:
    template <typename Call>
    Status change(Call call) {
        const KeyName key{KeyHandle::localMachine, std::string(kAssemblyRecords)};
        recorder_.beforeTree(key);
        const Status status = call();
        recorder_.afterTree(key, false);
        return status;
    }

    IAssemblyCache& real_;
    ChangeRecorder& recorder_;
};

RecordedPorts::RecordedPorts(const Ports& real, bool wholeServices, bool holdsCommits)
    : recorder_(*real.registry, wholeServices),
      ports_(real),
      registry_(std::make_unique<Registry>(*real.registry, recorder_, holdsCommits)),
      services_(std::make_unique<Services>(*real.services, recorder_)) {
    ports_.registry = registry_.get();
    ports_.services = services_.get();
    if (wholeServices) {
        assemblies_ = std::make_unique<Assemblies>(*real.assemblies, recorder_);
        ports_.assemblies = assemblies_.get();
    }
}

RecordedPorts::~RecordedPorts() = default;

ChangeSet RecordedPorts::changes() const {
    return registry_->changes();
}

}  // namespace kz7
