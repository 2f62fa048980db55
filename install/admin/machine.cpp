#include "install/admin/machine.h"

#include <algorithm>
#include <unordered_map>

#include "install/platform/service_manager.h"
#include "install/platform/text.h"
#include "install/src/add_copy.h"
#include "install/src/services/management_service.h"

namespace kz7 {
namespace {

constexpr std::string_view kServicePrefix = "KZ7MGMTSVC_";
constexpr std::string_view kSavedProperties = "SOFTWARE\\NVQ\\KZ7\\TEMP\\PROPERTIES95";
constexpr std::size_t kFieldRoom = 100;        // characters of a version field, the terminator included
constexpr std::size_t kLocationRoom = 10'000;  // of a location

// The data up to the first NUL, as a reader with room for that many characters gets it: empty if they do not fit.
std::string textAsRead(ValueType type, std::string_view data, std::size_t room) {
    const std::size_t length = isTextType(type) ? textLength(data) : data.size();
    const bool isTerminated = data.find('\0') != std::string_view::npos;
    return length < room || (length == room && isTerminated) ? std::string(data.substr(0, data.find('\0')))
                                                             : std::string{};
}

class MachineReader {
public:
    MachineReader(IRegistryStore& registry, Depth depth, MachineState& machine, std::string& key)
        : registry_(registry), depth_(depth), machine_(machine), key_(key), reader_(registry) {}

    Status run() {
        Status status = kSuccess;
        std::array<std::vector<CopyInView>, kViews.size()> found;
        for (std::size_t view = 0; status == kSuccess && view < kViews.size(); ++view) {
            status = readView(view, found[view]);
        }
        if (status != kSuccess) {
            return status;
        }
        merge(found[kNative], found[kOther]);
        addComputedAliases();
        status = readServices();
        return status == kSuccess && depth_ == Depth::whole ? readRest() : status;
    }

private:
    // kFileNotFound is no failure: what does not exist, or no longer, is not there.
    static Status present(Status status) { return isNotFound(status) || status == kKeyDeleted ? kSuccess : status; }

    Status open(KeyHandle parent, std::string_view path, OwnedKey& key) {
        return registry_.openKey(parent, path, kKeyWalk, key.receive());
    }

    Status readView(std::size_t view, std::vector<CopyInView>& copies) {
        OwnedKey key(registry_);
        key_ = kViews[view].copies;
        Status status = open(KeyHandle::localMachine, kViews[view].copies, key);
        if (status != kSuccess) {
            return present(status);
        }
        machine_.hasView[view] = true;
        std::vector<KeyValue> values;
        std::vector<Subkey> names;
        status = reader_.valuesInOrder(key.get(), values);
        status = status == kSuccess ? reader_.subkeys(key.get(), names) : status;
        addAliases(view, values);
        copies.reserve(names.size());
        for (auto name = names.begin(); status == kSuccess && name != names.end(); ++name) {
            CopyInView copy;
            copy.name = std::move(name->name);
            key_ = std::string(kViews[view].copies) + '\\' + copy.name;
            status = readCopy(key.get(), copy);
            if (status == kSuccess) {
                copies.push_back(std::move(copy));
            }
            status = present(status);
        }
        return status;
    }

    void addAliases(std::size_t view, const std::vector<KeyValue>& values) {
        bool isWalked = true;
        for (const KeyValue& value : values) {
            isWalked = isWalked && fitsCharacters(value.name, kAliasNameRoom - 1);
            AliasRow& row = machine_.aliases[foldUpper(value.name)];
            row.prefix = row.prefix.empty() ? value.name : row.prefix;
            const std::string text = value.data.substr(0, value.data.find('\0'));
            const bool isText = (value.type == ValueType::sz || value.type == ValueType::expandSz) &&
                                textAsRead(value.type, value.data, kFieldRoom) == text;
            row.values[view] = AliasValue{text, isText, isWalked};
            if (value.name.empty()) {
                machine_.defaultCopy[view] = text;
            }
        }
    }

    // kFileNotFound: the copy is gone.
    Status readCopy(KeyHandle view, CopyInView& copy) {
        OwnedKey key(registry_);
        OwnedKey below(registry_);
        Status status = open(view, copy.name, key);
        copy.rows.resize(copyRows().size());
        std::string_view opened;
        for (std::size_t row = 0; status == kSuccess && row < copy.rows.size(); ++row) {
            const LayoutRow& layout = copyRows()[row];
            if (isRead(layout) && layout.key != opened) {
                status = present(open(key.get(), layout.key, below));
                opened = layout.key;
            }
            if (status == kSuccess && isRead(layout)) {
                status = readRow((layout.key.empty() ? key : below).get(), row, copy);
            }
        }
        copy.location = copy.rows.front().value_or(std::string{});
        copy.info = InstallCopyInfo(copy.name, fieldsOf(copy));
        return status;
    }

    // Of a key that does not exist, none.
    Status readRow(KeyHandle key, std::size_t row, CopyInView& copy) {
        const LayoutRow& layout = copyRows()[row];
        if (key == KeyHandle::none) {
            return kSuccess;
        }
        const Status status =
            readText(key, layout.name, layout.data == kLocation ? kLocationRoom : kFieldRoom, copy.rows[row]);
        return status == kSuccess && layout.name == "Version" ? readText(key, "Fix Level", kFieldRoom, copy.fixLevel)
                                                              : present(status);
    }

    bool isRead(const LayoutRow& layout) const {
        return depth_ == Depth::whole || layout.key.empty() || layout.key == "CurrentVersion";
    }

    static std::array<std::string, 4> fieldsOf(const CopyInView& copy) {
        constexpr std::array<std::string_view, 3> kFields = {"Version", "Release", "Modification"};
        std::array<std::string, 4> fields;
        for (std::size_t row = 0; row < copy.rows.size(); ++row) {
            const auto* const field = std::find(kFields.begin(), kFields.end(), copyRows()[row].name);
            if (field != kFields.end()) {
                fields[static_cast<std::size_t>(field - kFields.begin())] = copy.rows[row].value_or(std::string{});
            }
        }
        fields.back() = copy.fixLevel.value_or(std::string{});
        return fields;
    }

    Status readText(KeyHandle key, std::string_view name, std::size_t room, std::optional<std::string>& text) {
        std::optional<ValueState> state;
        const Status status = reader_.value(key, name, state);
        if (status == kSuccess && state) {
            text = textAsRead(state->type, state->data, room);
        }
        return status;
    }

    // Both are sorted by upper-cased name.
    void merge(std::vector<CopyInView>& native, std::vector<CopyInView>& other) {
        auto left = native.begin();
        auto right = other.begin();
        machine_.copies.reserve(std::max(native.size(), other.size()));
        while (left != native.end() || right != other.end()) {
            int order = left == native.end() ? 1 : -1;
            if (left != native.end() && right != other.end()) {
                order = foldUpper(left->name).compare(foldUpper(right->name));
            }
            CopyRow& row = machine_.copies.emplace_back();
            if (order <= 0) {
                row.views[kNative] = std::move(*left++);
            }
            if (order >= 0) {
                row.views[kOther] = std::move(*right++);
            }
        }
    }

    void addComputedAliases() {
        CopiesByVersion versions;
        for (const CopyRow& copy : machine_.copies) {
            if (copy.isValid()) {
                versions.emplace_back(copy.shown().info.getVersion(), copy.name());
            }
        }
        orderByVersion(versions);
        std::unordered_map<std::string_view, std::string_view> versionOf;
        for (const auto& [version, name] : versions) {
            versionOf.emplace(name, version);
        }
        for (const auto& [prefix, name] : computeAliases(versions)) {
            AliasRow& row = machine_.aliases[foldUpper(prefix)];
            row.prefix = row.prefix.empty() ? prefix : row.prefix;
            row.should = name;
            row.exact = isWholeVersion(prefix);
            const auto version = versionOf.find(name);
            row.version = version == versionOf.end() ? std::string_view{} : version->second;
        }
    }

    Status readServices() {
        OwnedKey key(registry_);
        key_ = kServiceKeys.substr(0, kServiceKeys.size() - 1);
        Status status = open(KeyHandle::localMachine, key_, key);
        std::vector<Subkey> names;
        status = status == kSuccess ? reader_.subkeys(key.get(), names) : status;
        for (auto name = names.begin(); status == kSuccess && name != names.end(); ++name) {
            if (equalsIgnoreCase(std::string_view(name->name).substr(0, kServicePrefix.size()), kServicePrefix)) {
                key_ = std::string(kServiceKeys) + name->name;
                status = present(readService(key.get(), name->name));
            }
        }
        if (present(status) == kSuccess) {
            joinServices();
        }
        return present(status);
    }

    Status readService(KeyHandle services, const std::string& name) {
        ServiceRow service{name, name.substr(kServicePrefix.size()), {}, false, 0};
        OwnedKey key(registry_);
        std::optional<std::string> command;
        std::optional<ValueState> start;
        Status status = depth_ == Depth::whole ? open(services, name, key) : kSuccess;
        if (depth_ == Depth::whole && status == kSuccess) {
            status = readText(key.get(), "ImagePath", kLocationRoom, command);
            status = status == kSuccess ? reader_.value(key.get(), "Start", start) : status;
        }
        if (status == kSuccess) {
            service.isQuoted = command && command->starts_with('"');
            service.program = command ? programOf(*command) : std::string_view{};
            service.start = start && !start->data.empty() ? static_cast<unsigned char>(start->data.front()) : 0U;
            machine_.services.push_back(std::move(service));
        }
        return status;
    }

    void joinServices() {
        std::unordered_map<std::string, std::size_t> places;
        for (std::size_t place = 0; place < machine_.services.size(); ++place) {
            places.emplace(foldUpper(machine_.services[place].name), place);
        }
        for (CopyRow& copy : machine_.copies) {
            const auto place = places.find(foldUpper(managementServiceName(copy.name()).view()));
            copy.service = place == places.end() ? copy.service : place->second;
        }
    }

    Status readRest() {
        OwnedKey key(registry_);
        key_ = layout::kBackup;
        Status status = open(KeyHandle::localMachine, layout::kBackup, key);
        machine_.hasBackup = status == kSuccess;
        if (present(status) == kSuccess) {
            key_ = layout::kComponents;
            std::optional<std::string> marker;
            status = open(KeyHandle::localMachine, layout::kComponents, key);
            status = status == kSuccess ? readText(key.get(), layout::kVersion9Marker, kFieldRoom, marker) : status;
            machine_.hasMarker = marker.has_value();
        }
        return present(status) == kSuccess ? readUsers() : status;
    }

    // What cannot be read of another user's registry is not ours to judge.
    Status readUsers() {
        std::vector<Subkey> users;
        key_ = "HKEY_USERS";
        const Status status = reader_.subkeys(KeyHandle::users, users);
        for (const Subkey& user : users) {
            const std::string path = user.name + '\\' + std::string(kSavedProperties);
            OwnedKey key(registry_);
            const Status opened = open(KeyHandle::users, path, key);
            if (opened == kSuccess) {
                machine_.savedProperties.push_back(path);
            } else if (opened != kAccessDenied && present(opened) != kSuccess) {
                key_ = "HKEY_USERS\\" + path;
                return opened;
            }
        }
        return status;
    }

    IRegistryStore& registry_;
    Depth depth_;
    MachineState& machine_;
    std::string& key_;
    KeyReader reader_;
};

}  // namespace

const CopyRow* MachineState::find(std::string_view name) const {
    const std::string fold = foldUpper(name);
    const auto found = std::lower_bound(
        copies.begin(), copies.end(), fold,
        [](const CopyRow& copy, const std::string& wanted) { return foldUpper(copy.name()) < wanted; });
    return found == copies.end() || !equalsIgnoreCase(found->name(), name) ? nullptr : &*found;
}

Status readMachine(IRegistryStore& registry, Depth depth, MachineState& machine, std::string& key) {
    return MachineReader(registry, depth, machine, key).run();
}

std::string_view programOf(std::string_view command) {
    if (!command.starts_with('"')) {
        return command;
    }
    command.remove_prefix(1);
    return command.substr(0, command.find('"'));
}

bool hasPrefix(std::string_view version, std::string_view prefix) {
    if (isWholeVersion(prefix)) {
        return equalsIgnoreCase(version, prefix);
    }
    return version.size() > prefix.size() && version[prefix.size()] == '.' &&
           equalsIgnoreCase(version.substr(0, prefix.size()), prefix);
}

std::vector<const CopyRow*> candidatesOf(const MachineState& machine, std::string_view prefix) {
    std::vector<const CopyRow*> candidates;
    for (const CopyRow& copy : machine.copies) {
        if (copy.isValid() && hasPrefix(copy.shown().info.getVersion(), prefix)) {
            candidates.push_back(&copy);
        }
    }
    // Of two equal versions the later copy is the higher one.
    std::reverse(candidates.begin(), candidates.end());
    std::stable_sort(candidates.begin(), candidates.end(), [](const CopyRow* left, const CopyRow* right) {
        return left->shown().info.getVersion() > right->shown().info.getVersion();
    });
    return candidates;
}

}  // namespace kz7
