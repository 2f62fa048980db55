#include "install/runtime/installer_properties.h"

#include <algorithm>
#include <array>
#include <string>

#include "install/runtime/guarded.h"
#include "install/runtime/saved_property_names.h"
#include "install/src/registry/copy_name.h"
#include "install/src/registry/registry_access.h"

namespace kz7 {
namespace {

constexpr std::string_view kSavedProperties = "SOFTWARE\\NVQ\\KZ7\\TEMP\\PROPERTIES95";  // below a user's root
constexpr std::string_view kTableQuery = "SELECT `Property` FROM `Property` ORDER BY `Property`";
constexpr char kUserSid[] = "UserSID";
constexpr char kSourceFolder[] = "SOURCEDIR";
constexpr std::string_view kResolveSource = "ResolveSource";
constexpr char kBaseClientSelected[] = "BASE_CLIENT_BIN_SELECTED";
constexpr std::string_view kBaseClient = "BASE_CLIENT.bin";
constexpr std::string_view kDocumentationProduct = "PROD_DOCE";

constexpr std::array<std::string_view, 5> kFeaturesWithState = {
    "ADMIN_SERVER.bin", "LDAP.bin", "VS_DOT_NET.bin", kBaseClient, "ODBC_SUPPORT",
};

bool isDeferred(IInstallerSession& session) {
    bool isOn = false;
    return (session.runMode(RunMode::scheduled, isOn) == kSuccess && isOn) ||
           (session.runMode(RunMode::rollback, isOn) == kSuccess && isOn);
}

// The root of the user who installs; silently that of the caller when the user is not known or the root does not open.
class UserRoot {
public:
    UserRoot(IRegistryStore& registry, std::string_view sid) : opened_(registry) {
        if (!sid.empty()) {
            registry.openKey(KeyHandle::users, sid, kKeyFull, opened_.receive());
        }
    }

    KeyHandle key() const { return opened_ ? opened_.get() : KeyHandle::currentUser; }

private:
    OwnedKey opened_;
};

// A property's value as iMsiGetProperty() reads it.
struct PropertyValue {
    PropertyValue(const Installation& at, const char* name) : status(readProperty(at, name, room)) {}

    std::string_view text() const { return status == kSuccess ? room.text() : std::string_view{}; }

    TextBuffer<kPropertySize> room;
    Status status;
};

UserRoot rootOfUser(const Installation& at) {
    const PropertyValue sid(at, kUserSid);
    traceProperty(at, "iMsiGetProperty", kUserSid, sid.status);
    return {at.registry, sid.text()};
}

// What an installation does with a feature; an unknown feature is neither removed nor selected.
struct FeatureRequest {
    FeatureRequest(IInstallerSession& session, std::string_view feature) {
        FeatureState installed = FeatureState::unknown;
        FeatureState requested = FeatureState::unknown;
        if (session.featureState(feature, installed, requested) == kSuccess) {
            isRemoved = requested == FeatureState::absent && isThere(installed);
            isSelected = requested == FeatureState::local || requested == FeatureState::source;
        }
    }

    bool isRemoved = false;
    bool isSelected = false;

private:
    static bool isThere(FeatureState state) { return state != FeatureState::absent && state != FeatureState::unknown; }
};

// The key that properties are saved in.
class SavedProperties {
public:
    // Values of an earlier installation, secrets among them, must not be read in this one.
    explicit SavedProperties(const Installation& at) : at_(at), root_(rootOfUser(at)), key_(at.registry) {
        const Status status = deleteTree(at.registry, root_.key(), kSavedProperties, 0, {}, {});
        if (status != kSuccess && !isNotFound(status)) {
            at.ure.trace(kTraceError, "iSavePropertiesForDeferred", 20, status, kSavedProperties);
        }
    }

    void open() {
        const Status status = at_.registry.createKey(root_.key(), kSavedProperties, {}, kKeyFull, key_.receive());
        if (status != kSuccess) {
            at_.ure.trace(kTraceError, "iSavePropertiesForDeferred", 30, status, kSavedProperties);
        }
    }

    // Saves the rows of an executed view. The status that ended them early, or success.
    Status saveTable(SessionHandle view) {
        for (;;) {
            OwnedSessionHandle record(at_.session);
            const Status status = at_.session.fetchRecord(view, record.receive());
            if (status != kSuccess) {
                return isEndOfItems(status) ? kSuccess : status;
            }
            if (const std::string name = nameIn(record.get()); !name.empty()) {
                saveProperty(name.c_str());
            }
        }
    }

    void saveListed() {
        for (const char* name : kSavedPropertyNames) {
            saveProperty(name);
        }
    }

    void saveFeatureStates() {
        for (const std::string_view feature : kFeaturesWithState) {
            const FeatureRequest request(at_.session, feature);
            if (request.isRemoved || request.isSelected) {
                write(compose("%s_SELECT_STATE", {feature}), request.isRemoved ? "DESELECTED" : "SELECTED");
            }
        }
    }

    void saveResponses() {
        for (const ResponseKeyword& keyword : at_.ure.responses) {
            if (!keyword.name.empty() && !keyword.value.empty() && !equalsIgnoreCase(keyword.name, kProductKeyword)) {
                write(compose("PROP_RSP_%s", {keyword.name}), keyword.value);
            }
        }
    }

private:
    // The name in a row of the table; empty if it cannot be read.
    std::string nameIn(SessionHandle record) {
        Buffer none(nullptr, 0);
        if (at_.session.recordString(record, 1, none) != kMoreData) {
            return {};
        }
        std::string name(none.size + std::size_t{1}, '\0');
        Buffer room(name.data(), static_cast<std::uint32_t>(name.size()));
        return at_.session.recordString(record, 1, room) == kSuccess ? std::string(room.text()) : std::string{};
    }

    void saveProperty(const char* name) {
        const PropertyValue value(at_, name);
        if (name == std::string_view(kSourceFolder) && value.status == kSuccess && value.text().empty() &&
            at_.ure.productAbbreviation == kDocumentationProduct) {
            traceProperty(at_, "MsiDoAction", kResolveSource, at_.session.doAction(kResolveSource));
            const PropertyValue resolved(at_, name);
            traceProperty(at_, "iMsiGetProperty", name, resolved.status);
            if (resolved.status == kSuccess) {
                write(name, resolved.text());
            }
        } else if (value.status == kSuccess) {
            write(name, value.text());
        } else {
            traceProperty(at_, "iMsiGetProperty", name, value.status);
        }
    }

    void write(std::string_view name, std::string_view value) {
        if (!key_) {
            return;
        }
        const Status status = fitsCharacters(value, kPropertySize - 1)
                                  ? at_.registry.setValue(key_.get(), name, ValueType::sz, std::string(value) + '\0')
                                  : kMoreData;
        if (status != kSuccess) {
            traceProperty(at_, "iSavePropertiesForDeferred", name, status);
        }
    }

    const Installation& at_;
    UserRoot root_;
    OwnedKey key_;
};

bool isReadableWhenScheduled(std::string_view name) {
    return std::find(kReadableWhenScheduled.begin(), kReadableWhenScheduled.end(), name) !=
           kReadableWhenScheduled.end();
}

// A value as it was saved. Any status but success: none that fits.
Status readSaved(const Installation& at, const char* name, Buffer& value) {
    TextBuffer<kPropertySize> sid;
    const bool known = at.session.getProperty(kUserSid, sid) == kSuccess;
    const UserRoot root(at.registry, known ? sid.text() : std::string_view{});
    // Deliberate: the path of the key passes through the process-wide buffer of the copy-name substitution; callers
    // that still read an earlier result there find this path.
    overwriteSharedOutput(kSavedProperties);
    OwnedKey key(at.registry);
    Status status = at.registry.openKey(root.key(), kSavedProperties, kKeyFull, key.receive());
    if (status == kSuccess) {
        status = queryText(at.registry, key.get(), name, value);
    }
    if (status == kSuccess && value.size < value.capacity) {
        value.data[value.size] = '\0';
    }
    return status;
}

Status readValue(const Installation& at, const char* name, Buffer& value) {
    if (!isDeferred(at.session)) {
        return at.session.getProperty(name, value);
    }
    if (isReadableWhenScheduled(name)) {
        // The user can write the saved values: a planted UserSID would lead a deletion to another user's key.
        const Status status = at.session.getProperty(name, value);
        if (status != kSuccess || value.size != 0) {
            return status;
        }
    }
    return readSaved(at, name, value) == kSuccess ? kSuccess : at.session.getProperty(name, value);
}

Status readInto(const Installation& at, const char* name, char* buffer, std::uint32_t* size) {
    const bool isNamed = name != nullptr && buffer != nullptr;
    if (!isNamed || size == nullptr) {
        return !isNamed && !isDeferred(at.session) ? kMissingItem : kInvalidParameter;
    }
    Buffer value(buffer, *size);
    const Status status = readValue(at, name, value);
    if (status == kSuccess || status == kMoreData) {
        // Deliberate: the size of a saved value counts the terminator, as the registry does; the installer's does not.
        *size = value.size;
    }
    return status;
}

// The installation's own name of the product counts more than that of a response file.
void takeProduct(const Installation& at) {
    const PropertyValue product(at, kProductKeyword);
    traceProperty(at, "iMsiGetProperty", kProductKeyword, product.status);
    if (!product.text().empty()) {
        at.ure.productAbbreviation = product.text();
    }
}

Status saveProperties(const Installation& at) {
    OwnedSessionHandle database(at.session);
    if (at.session.activeDatabase(database.receive()) != kSuccess) {
        at.ure.trace(kTraceError, "iSavePropertiesForDeferred", 10, kNoInstallationDatabase, {});
        return kNoInstallationDatabase;
    }
    SavedProperties saved(at);
    takeProduct(at);
    OwnedSessionHandle view(at.session);
    Status status = at.session.openView(database.get(), kTableQuery, view.receive());
    if (status == kSuccess) {
        status = at.session.executeView(view.get());
    }
    if (status != kSuccess) {
        return status;
    }
    saved.open();
    const char* selected = FeatureRequest(at.session, kBaseClient).isSelected ? "Y" : "N";
    traceProperty(at, "iMsiSetProperty", kBaseClientSelected, iMsiSetProperty(at, kBaseClientSelected, selected));
    status = saved.saveTable(view.get());
    saved.saveListed();
    saved.saveFeatureStates();
    saved.saveResponses();
    return status;
}

}  // namespace

Status iMsiGetProperty(const Installation& at, const char* name, char* buffer, std::uint32_t* size) {
    return guarded([&] { return readInto(at, name, buffer, size); });
}

Status readProperty(const Installation& at, const char* name, Buffer& value) {
    return guarded([&] { return readValue(at, name, value); });
}

Status iMsiSetProperty(const Installation& at, const char* name, const char* value) {
    return guarded([&] {
        return name == nullptr ? kInvalidParameter : at.session.setProperty(name, value != nullptr ? value : "");
    });
}

Status iSavePropertiesForDeferred(const Installation& at) {
    return guarded([&] { return saveProperties(at); });
}

Status iDeleteSavedProperties(const Installation& at) {
    return guarded([&] {
        const UserRoot root = rootOfUser(at);
        const Status status = deleteTree(at.registry, root.key(), kSavedProperties, 0, {}, {});
        return isNotFound(status) ? kSuccess : status;
    });
}

void traceProperty(const Installation& at, std::string_view operation, std::string_view name, Status status) {
    const std::array<Insert, 3> inserts = {operation, name, status};
    at.ure.traceMessage(kPropertyMessage, inserts);
}

}  // namespace kz7
