#include "install/src/registry/change_recorder.h"

#include <algorithm>
#include <utility>

#include "install/platform/assembly_records.h"
#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

// The name up to the last separator; empty without one.
std::string_view parentOf(std::string_view name) {
    const std::size_t end = name.rfind('\\');
    return name.substr(0, end == std::string_view::npos ? 0 : end);
}

bool isRoot(KeyHandle key) {
    return key == KeyHandle::localMachine || key == KeyHandle::users || key == KeyHandle::currentUser;
}

// The values that the run has not touched yet, as they are before it.
void addValues(TouchedRows::Key& key, std::vector<KeyValue>& values) {
    const bool isNew = key.rows.empty();
    for (KeyValue& value : values) {
        if (isNew || key.find(value.name) == nullptr) {
            key.add(std::move(value));
        }
    }
}

}  // namespace

// Keeps the spelling of all keys below an open one: a search for each of them would take quadratic time.
void ChangeRecorder::spellBelow(KeyHandle key, const std::string& fullName) {
    std::vector<Subkey> subkeys;
    const Status status = reader_.subkeysInOrder(key, subkeys);
    keep(isNotFound(status) ? kSuccess : status);
    for (Subkey& subkey : subkeys) {
        const std::string full = fullName + '\\' + subkey.name;
        spelled_.try_emplace(walkPlace(full), Spelling{full, std::move(subkey.keyClass)});
    }
}

// The name and the class as the store has them. The last name of a key that does not exist is taken as it is given.
// Begins at the deepest key above that is known, and opens each key below the handle of the one above: a tree may be
// deeper than a path is long, or than the stack.
const ChangeRecorder::Spelling& ChangeRecorder::spell(const KeyName& name, bool exists) {
    const std::string given = fullKeyName(name);
    const std::string place = walkPlace(given);
    const std::size_t root = given.size() - name.path.size() - (name.path.empty() ? 0 : 1);
    spelled_.try_emplace(place.substr(0, root), Spelling{given.substr(0, root), {}});
    std::size_t end = place.size();
    // Deliberate: a key that the run deletes and creates again keeps its first spelling.
    auto known = spelled_.find(place);
    while (known == spelled_.end()) {
        end = place.rfind('\0', end - 1);
        known = spelled_.find(place.substr(0, end));
    }
    OwnedKey key(registry_);
    Status status = end == place.size()
                        ? kSuccess
                        : registry_.openKey(name.root, name.path.substr(0, end > root ? end - root - 1 : 0),
                                            kKeyWalk | kKeyOpenLink, key.receive());
    while (end != place.size()) {
        const std::size_t next = std::min(place.find('\0', end + 1), place.size());
        std::string full = known->second.name;
        const std::string last = given.substr(end + 1, next - end - 1);
        keep(isNotFound(status) ? kSuccess : status);
        if (status == kSuccess && (exists || next != place.size())) {
            spellBelow(key.get(), full);
        }
        if (status == kSuccess && next != place.size()) {
            OwnedKey below(registry_);
            status = registry_.openKey(key.get(), last, kKeyWalk | kKeyOpenLink, below.receive());
            key = std::move(below);
        }
        full.append(1, '\\').append(last);
        known = spelled_.try_emplace(place.substr(0, next), Spelling{std::move(full), {}}).first;
        end = next;
    }
    return known->second;
}

ChangeRecorder::Key& ChangeRecorder::note(const KeyName& name, bool exists) {
    bool isNew = false;
    Key& key = rows_.key(fullKeyName(name), isNew);
    if (isNew) {
        key.before = key.now = exists;
    }
    return key;
}

// Most keys that a run writes to stay as they are, and their names are not needed.
ChangeRecorder::Key& ChangeRecorder::named(const KeyName& name, Key& key) {
    if (std::exchange(key.isNamed, true)) {
        return key;
    }
    if (const Key* const above = key.before ? nullptr : rows_.find(parentOf(key.name));
        above != nullptr && above->isNamed) {
        key.name.replace(0, above->name.size(), above->name);
        return key;
    }
    const Spelling& spelling = spell(name, key.before);
    key.name = spelling.name;
    key.classBefore = key.classNow = spelling.keyClass;
    return key;
}

bool ChangeRecorder::exists(KeyHandle root, std::string_view path, std::string_view fullName) {
    if (const Key* const known = rows_.find(fullName); known != nullptr) {
        return known->now;
    }
    OwnedKey key(registry_);
    const Status status = registry_.openKey(root, path, kKeyQueryValue | kKeyOpenLink, key.receive());
    keep(isNotFound(status) ? kSuccess : status);
    return !isNotFound(status);
}

// The key and those above it that do not exist, the highest last.
std::vector<KeyName> ChangeRecorder::missingKeys(const KeyName& name) {
    std::vector<KeyName> missing = {name};
    const std::string full = fullKeyName(name);
    std::string_view path = parentOf(name.path);
    std::string_view fullName = parentOf(full);
    bool isRootNext = name.path.empty();
    while (!isRootNext && !exists(name.root, path, fullName)) {
        missing.push_back({name.root, std::string(path)});
        isRootNext = path.empty();
        path = parentOf(path);
        fullName = parentOf(fullName);
    }
    return missing;
}

void ChangeRecorder::write(const std::vector<const Key*>& keys, TouchedForm form) {
    std::string part;
    for (const Key* const key : keys) {
        std::vector<const Row*> rows;
        for (const Row& row : key->rows) {
            rows.push_back(&row);
        }
        appendTouched(*key, rows, form, part);
    }
    journal_->append(std::move(part));
}

void ChangeRecorder::write(const Key& key, const Row& row) {
    std::string part;
    appendTouched(key, {&row}, TouchedForm::step, part);
    journal_->append(std::move(part));
}

template <typename Call>
Status ChangeRecorder::createKey(Place& place, std::string_view keyClass, Call call) {
    if (!isRecorded(place.name)) {
        return call();
    }
    std::vector<Key*> keys;
    const std::vector<KeyName> missing = missingKeys(place.name);
    for (auto key = missing.rbegin(); key != missing.rend(); ++key) {
        keys.push_back(&named(*key, false));
        rows_.create(*keys.back(), {});
    }
    place.key = keys.back();
    rows_.create(*place.key, keyClass);
    if (journal_ != nullptr) {
        write({keys.begin(), keys.end()}, TouchedForm::step);
    }
    const Status status = call();
    if (status != kSuccess) {
        for (Key* const key : keys) {
            key->now = false;
        }
        if (journal_ != nullptr) {
            write({keys.begin(), keys.end()}, TouchedForm::step);
        }
    }
    return status;
}

Status ChangeRecorder::open(const KeyName& name, const Key& key) {
    if (open_ && opened_ == &key) {
        return kSuccess;
    }
    opened_ = &key;
    return registry_.openKey(name.root, name.path, kKeyWalk | kKeyOpenLink, open_.receive());
}

// Notes the values of a key that exists.
void ChangeRecorder::list(const KeyName& name, Key& key) {
    if (std::exchange(key.isListed, true)) {
        return;
    }
    std::vector<KeyValue> values;
    Status status = open(name, key);
    status = status == kSuccess ? reader_.valuesInOrder(open_.get(), values) : status;
    keep(status);
    addValues(key, values);
    // A handle with a place in an enumeration makes each deletion slower.
    rest();
}

template <typename Open, typename Call>
Status ChangeRecorder::deleteKey(const KeyName& name, Open open, Call call) {
    rest();
    if (!isRecorded(name)) {
        return call();
    }
    Status status = open(open_);
    if (isNotFound(status)) {
        return call();
    }
    keep(status);
    Key& key = named(name, true);
    opened_ = &key;
    if (key.before) {
        list(name, key);
    }
    rest();
    if (journal_ != nullptr) {
        write({&key}, TouchedForm::removal);
    }
    status = call();
    if (status == kSuccess) {
        rows_.remove(key);
    } else if (journal_ != nullptr) {
        write({&key}, TouchedForm::whole);
    }
    return status;
}

// Null for a value that is to stay as it is.
ChangeRecorder::Row* ChangeRecorder::beforeValue(const KeyName& name, Key& key, std::string_view value,
                                                 const std::optional<ValueState>& now) {
    Row* const known = key.isListed || !key.before ? &key.row(value) : key.find(value);
    if (known != nullptr) {
        return known->current() == now ? nullptr : known;
    }
    std::optional<ValueState> state;
    Status status = open(name, key);
    status = status == kSuccess ? reader_.value(open_.get(), value, state) : status;
    keep(status);
    if (state == now) {
        return nullptr;
    }
    if (state) {
        // The only way to find out how the store spells the name.
        list(name, key);
    }
    return &key.row(value);
}

template <typename Call>
Status ChangeRecorder::changeValue(Place& place, std::string_view value, std::optional<ValueState> now, Call call) {
    if (place.key == nullptr) {
        place.key = rows_.find(fullKeyName(place.name));
    }
    if (place.key == nullptr) {
        if (!isRecorded(place.name)) {
            return call();
        }
        place.key = &note(place.name, true);
    }
    Key& key = *place.key;
    Row* const row = beforeValue(place.name, key, value, now);
    if (row == nullptr) {
        return call();
    }
    named(place.name, key);
    const bool wasTouched = row->isTouched;
    std::optional<ValueState> previous = std::move(row->now);
    rows_.set(key, *row, std::move(now));
    if (journal_ != nullptr) {
        write(key, *row);
    }
    const Status status = call();
    if (status != kSuccess) {
        row->isTouched = wasTouched;
        row->now = std::move(previous);
        if (journal_ != nullptr) {
            write(key, *row);
        }
    }
    return status;
}

void ChangeRecorder::beforeTree(const KeyName& name) {
    rest();
    missing_.clear();
    if (!exists(name.root, name.path, fullKeyName(name))) {
        missing_ = missingKeys(name);
        for (const KeyName& key : missing_) {
            named(key, false);
        }
        return;
    }
    KeyStart start;
    Snapshot tree;
    std::string unread;
    Status status = findKey(registry_, name, start);
    status = status == kSuccess ? readSnapshot(registry_, wholeServices_, {start}, tree, unread) : status;
    keep(status);
    for (KeyRecord& record : tree) {
        bool isNew = false;
        Key& key = rows_.key(record.name, isNew);
        if (!std::exchange(key.isNamed, true)) {
            key.name = record.name;
            key.classBefore = key.classNow = record.keyClass;
            key.before = key.now = true;
        }
        if (!std::exchange(key.isListed, true)) {
            addValues(key, record.values);
        }
    }
}

// Tells the journal what is going to be.
void ChangeRecorder::expectTree(const KeyName& name, bool isDeletion, const std::vector<ServiceValue>& expected) {
    std::vector<const Key*> keys;
    if (isDeletion) {
        rows_.visitTree(fullKeyName(name), [&](const Key& key) { keys.insert(keys.begin(), &key); });
        write(keys, TouchedForm::removal);
        return;
    }
    for (const KeyName& missing : missing_) {
        Key& key = named(missing, false);
        rows_.create(key, {});
        keys.insert(keys.begin(), &key);
    }
    Key& key = named(name, true);
    for (const ServiceValue& value : expected) {
        rows_.set(key, key.row(value.name), ValueState{value.type, value.data});
    }
    if (missing_.empty()) {
        keys.push_back(&key);
    }
    write(keys, TouchedForm::step);
}

void ChangeRecorder::afterTree(const KeyName& name, bool isDeleted) {
    // As if a key and everything below it were gone.
    rows_.visitTree(fullKeyName(name), [&](Key& key) { rows_.remove(key); });
    OwnedKey opened(registry_);
    for (const KeyName& missing : std::exchange(missing_, {})) {
        rows_.exists(named(missing, false), registry_.openKey(missing.root, missing.path, kKeyQueryValue | kKeyOpenLink,
                                                              opened.receive()) == kSuccess);
    }
    if (isDeleted) {
        return;
    }
    // Its name is known: a search among all services for each of them would take quadratic time.
    const Key& top = named(name, false);
    KeyStart start{name, top.classNow};
    parseKeyName(top.name, start.name);
    Snapshot tree;
    std::string unread;
    const Status status = readSnapshot(registry_, wholeServices_, {start}, tree, unread);
    keep(isNotFound(status) ? kSuccess : status);
    for (const KeyRecord& record : tree) {
        bool isNew = false;
        Key& key = rows_.key(record.name, isNew);
        key.isNamed = true;
        key.classNow = record.keyClass;
        rows_.exists(key, true);
        for (const KeyValue& value : record.values) {
            rows_.set(key, key.row(value.name), ValueState{value.type, value.data});
        }
    }
}

template <typename Call>
Status ChangeRecorder::changeTree(const KeyName& name, bool isDeletion, const std::vector<ServiceValue>& expected,
                                  Call call) {
    if (!isRecorded(name)) {
        return call();
    }
    beforeTree(name);
    if (journal_ != nullptr && (isDeletion || !expected.empty())) {
        expectTree(name, isDeletion, expected);
    }
    const std::vector<KeyName> missing = missing_;
    const Status status = call();
    // The key of a deleted service may stay for as long as a handle is open.
    afterTree(name, isDeletion && status == kSuccess);
    if (journal_ != nullptr) {
        std::vector<const Key*> keys;
        for (auto key = missing.rbegin(); key != missing.rend(); ++key) {
            keys.push_back(&named(*key, false));
        }
        rows_.visitTree(fullKeyName(name), [&](const Key& key) { keys.push_back(&key); });
        write(keys, TouchedForm::whole);
    }
    return status;
}

// Knows the name of every open key.
class RecordedPorts::Registry final : public IRegistryStore {
public:
    Registry(IRegistryStore& real, ChangeRecorder& recorder, IHistory* history, bool holdsCommits)
        : real_(real), recorder_(recorder), history_(history), holdsCommits_(holdsCommits) {}

    Status openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) override {
        const Status status = real_.openKey(parent, path, access, key);
        return status == kSuccess ? opened({nameOf(parent, path, access), nullptr}, key) : status;
    }
    Status createKey(KeyHandle parent, std::string_view path, std::string_view keyClass, AccessMask access,
                     KeyHandle& key) override {
        ChangeRecorder::Place place{nameOf(parent, path, access), nullptr};
        Status status = real_.openKey(parent, path, access, key);
        if (isNotFound(status)) {
            status = recorder_.createKey(place, keyClass,
                                         [&] { return real_.createKey(parent, path, keyClass, access, key); });
        } else if (status != kSuccess) {
            const Status unread = status;
            status = real_.createKey(parent, path, keyClass, access, key);
            recorder_.keep(status == kSuccess ? unread : kSuccess);
        }
        return status == kSuccess ? opened(std::move(place), key) : status;
    }
    Status closeKey(KeyHandle key) override {
        open_.erase(key);
        return real_.closeKey(key);
    }
    Status queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) override {
        return real_.queryValue(key, name, type, data);
    }
    Status setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) override {
        return recorder_.changeValue(placeOf(key), name, ValueState{type, std::string(data)},
                                     [&] { return real_.setValue(key, name, type, data); });
    }
    Status deleteValue(KeyHandle key, std::string_view name) override {
        return recorder_.changeValue(placeOf(key), name, std::nullopt, [&] { return real_.deleteValue(key, name); });
    }
    Status enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) override {
        return real_.enumerateKey(key, index, name, keyClass);
    }
    Status enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type, Buffer* data) override {
        return real_.enumerateValue(key, index, name, type, data);
    }
    Status deleteKey(KeyHandle parent, std::string_view path, AccessMask view) override {
        // A path from the root would be followed through each key of a deep tree.
        const auto open = [&](OwnedKey& key) {
            return real_.openKey(parent, path, view | kKeyWalk | kKeyOpenLink, key.receive());
        };
        return recorder_.deleteKey(nameOf(parent, path, view), open,
                                   [&] { return real_.deleteKey(parent, path, view); });
    }
    Status commit() override {
        recorder_.rest();
        return holdsCommits_ ? kSuccess : save();
    }

    Status save() {
        recorder_.rest();
        std::string part = recorder_.rows().takePart();
        if (!holdsCommits_) {
            saved_.push_back(part);
        }
        Status status = kSuccess;
        if (history_ != nullptr) {
            status = history_->takesEachChange() || part.empty() ? kSuccess : history_->append(std::move(part));
            status = status == kSuccess ? history_->settle(recorder_.rows().counts()) : status;
        }
        // Ends the transaction in any case.
        const Status committed = real_.commit();
        status = status == kSuccess ? committed : status;
        if (status != kSuccess && !holdsCommits_) {
            saved_.pop_back();
        }
        return status;
    }

    template <typename Read>
    auto read(Read read) const {
        if (holdsCommits_) {
            return read(recorder_.rows());
        }
        TouchedRows rows;
        for (const std::string& part : saved_) {
            rows.add(part);
        }
        return read(rows);
    }

private:
    ChangeRecorder::Place& placeOf(KeyHandle key) {
        ChangeRecorder::Place& place = open_[key];
        if (place.name.root == KeyHandle::none) {
            place.name.root = key;
        }
        return place;
    }

    KeyName nameOf(KeyHandle parent, std::string_view path, AccessMask access) const {
        KeyName name{parent, {}};
        if (const auto open = open_.find(parent); open != open_.end()) {
            name = open->second.name;
        }
        const std::string plain = plainKeyPath(parent, path, access);
        name.path.reserve(name.path.size() + 1 + plain.size());
        std::string_view rest = plain;
        for (std::string_view part; takeName(rest, part);) {
            name.path.append(name.path.empty() ? "" : "\\").append(part);
        }
        return name;
    }
    Status opened(ChangeRecorder::Place place, KeyHandle key) {
        if (!isRoot(key)) {
            open_.insert_or_assign(key, std::move(place));
        }
        return kSuccess;
    }

    IRegistryStore& real_;
    ChangeRecorder& recorder_;
    IHistory* history_;
    bool holdsCommits_;
    std::vector<std::string> saved_;  // parts
    std::unordered_map<KeyHandle, ChangeRecorder::Place> open_;
};

// A service is recorded as the key of its record, which every service manager keeps in the same place.
class RecordedPorts::Services final : public IServiceManager {
public:
    Services(IServiceManager& real, ChangeRecorder& recorder) : real_(real), recorder_(recorder) {}

    Status openManager(std::uint32_t access, ServiceHandle& manager) override {
        return real_.openManager(access, manager);
    }
    Status createService(ServiceHandle manager, const ServiceDefinition& definition, ServiceHandle& service) override {
        const Status status = change(definition.name, false, serviceValues(definition),
                                     [&] { return real_.createService(manager, definition, service); });
        return opened(status, definition.name, service);
    }
    Status openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                       ServiceHandle& service) override {
        return opened(real_.openService(manager, name, access, service), name, service);
    }
    Status changeStartType(ServiceHandle service, ServiceStart start) override {
        return change(open_[service], false, serviceValues({{}, {}, {}, kServiceOwnProcess, start}, {"Start"}),
                      [&] { return real_.changeStartType(service, start); });
    }
    Status configureService(ServiceHandle service, const ServiceDefinition& definition) override {
        return change(open_[service], false, serviceValues(definition),
                      [&] { return real_.configureService(service, definition); });
    }
    Status startService(ServiceHandle service) override {
        return change(open_[service], false, {}, [&] { return real_.startService(service); });
    }
    Status stopService(ServiceHandle service) override {
        return change(open_[service], false, {}, [&] { return real_.stopService(service); });
    }
    Status waitForStop(ServiceHandle service, std::uint32_t milliseconds) override {
        return real_.waitForStop(service, milliseconds);
    }
    Status queryState(ServiceHandle service, ServiceState& state) override { return real_.queryState(service, state); }
    Status deleteService(ServiceHandle service) override {
        return change(open_[service], true, {}, [&] { return real_.deleteService(service); });
    }
    Status closeHandle(ServiceHandle handle) override {
        open_.erase(handle);
        return real_.closeHandle(handle);
    }

private:
    template <typename Call>
    Status change(std::string_view name, bool isDeletion, const std::vector<ServiceValue>& expected, Call call) {
        if (!isServiceName(name)) {
            return call();
        }
        return recorder_.changeTree({KeyHandle::localMachine, std::string(kServiceKeys) + std::string(name)},
                                    isDeletion, expected, call);
    }
    Status opened(Status status, std::string_view name, const ServiceHandle& service) {
        if (status == kSuccess) {
            open_.insert_or_assign(service, std::string(name));
        }
        return status;
    }

    IServiceManager& real_;
    ChangeRecorder& recorder_;
    std::unordered_map<ServiceHandle, std::string> open_;  // names
};

// Writes to the registry only where that holds the cache's records.
class RecordedPorts::Assemblies final : public IAssemblyCache {
public:
    // `outside`: gets a note of what is registered elsewhere; else null.
    Assemblies(IAssemblyCache& real, ChangeRecorder& recorder, IHistory* outside)
        : real_(real), recorder_(recorder), outside_(outside) {}

    Status deregisterProviders(std::string_view level) override {
        return change("removed data providers from the assembly cache",
                      [&] { return real_.deregisterProviders(level); });
    }
    Status registerProviders(std::string_view location, std::string_view level,
                             FrameworkGenerations generations) override {
        return change("added data providers to the assembly cache",
                      [&] { return real_.registerProviders(location, level, generations); });
    }

private:
    template <typename Call>
    Status change(std::string_view what, Call call) {
        if (outside_ != nullptr) {
            outside_->note(what);
            return call();
        }
        return recorder_.changeTree({KeyHandle::localMachine, std::string(kAssemblyRecords)}, false, {}, call);
    }

    IAssemblyCache& real_;
    ChangeRecorder& recorder_;
    IHistory* outside_;
};

// Notes the programs that are started. The operations on streams are called on other threads and from destructors.
class RecordedPorts::Programs final : public IProcessHost {
public:
    Programs(IProcessHost& real, IHistory& history) : real_(real), history_(history) {}

    Status startProcess(const ProcessStart& start, ProcessInformation& started) override {
        const Status status = real_.startProcess(start, started);
        if (status == kSuccess) {
            history_.note("ran " + std::string(start.commandLine));
        }
        return status;
    }

    // clang-format off
    Status getSlot(StandardSlot slot, StreamHandle& stream) override { return real_.getSlot(slot, stream); }
    Status setSlot(StandardSlot slot, StreamHandle stream) override { return real_.setSlot(slot, stream); }
    Status createPipe(StreamHandle& readEnd, StreamHandle& writeEnd) override { return real_.createPipe(readEnd, writeEnd); }
    Status duplicate(StreamHandle stream, StreamHandle& copy) override { return real_.duplicate(stream, copy); }
    Status read(StreamHandle stream, Buffer& data) override { return real_.read(stream, data); }
    Status write(StreamHandle stream, std::string_view data) override { return real_.write(stream, data); }
    Status closeStream(StreamHandle stream) override { return real_.closeStream(stream); }
    Status waitProcess(ProcessHandle process, std::uint32_t milliseconds) override { return real_.waitProcess(process, milliseconds); }
    Status exitCode(ProcessHandle process, std::uint32_t& code) override { return real_.exitCode(process, code); }
    Status closeProcess(ProcessHandle process) override { return real_.closeProcess(process); }
    Status shortPath(std::string_view path, Buffer& shortened) override { return real_.shortPath(path, shortened); }
    // clang-format on

private:
    IProcessHost& real_;
    IHistory& history_;
};

RecordedPorts::RecordedPorts(const Ports& real, const RecordOptions& options)
    : history_(real.history != nullptr && real.history->isOn() ? real.history : nullptr),
      recorder_(*real.registry, options, history_),
      ports_(real),
      registry_(std::make_unique<Registry>(*real.registry, recorder_, history_, options.holdsCommits)) {
    if (options.wholeServices) {
        services_ = std::make_unique<ServiceRecords>(*registry_, *real.files);
    } else {
        services_ = std::make_unique<Services>(*real.services, recorder_);
    }
    ports_.registry = registry_.get();
    ports_.services = services_.get();
    if (options.wholeServices || history_ != nullptr) {
        assemblies_ =
            std::make_unique<Assemblies>(*real.assemblies, recorder_, options.wholeServices ? nullptr : history_);
        ports_.assemblies = assemblies_.get();
    }
    if (history_ != nullptr) {
        programs_ = std::make_unique<Programs>(*real.processes, *history_);
        ports_.processes = programs_.get();
    }
}

// A run that fails where every change is final ends without a commit point.
RecordedPorts::~RecordedPorts() {
    if (history_ != nullptr && history_->takesEachChange()) {
        history_->settle(recorder_.rows().counts());
    }
}

Status RecordedPorts::commit() {
    return registry_->save();
}

ChangeSet RecordedPorts::changes() const {
    return registry_->read([](const TouchedRows& rows) { return rows.changes(); });
}

ChangeCounts RecordedPorts::counts() const {
    return registry_->read([](const TouchedRows& rows) { return rows.counts(); });
}

}  // namespace kz7
