// Installer properties in immediate and deferred custom actions, on a session with the restrictions of the installer.
#include <gtest/gtest.h>

#include "install/runtime/installer_properties.h"
#include "install/runtime/saved_property_names.h"
#include "install/src/registry/copy_name.h"
#include "tests/support/registry_dump.h"
#include "tests/support/runtime_machine.h"

namespace kz7::test {
namespace {

const std::string kKey = "SOFTWARE\\NVQ\\KZ7\\TEMP\\PROPERTIES95";

class InstallerProperties : public testing::Test {
protected:
    InstallerProperties() { machine.openLog(); }

    // Saves a value in a user's key, or in the caller's.
    void save(const std::string& user, std::string_view bytes, const char* name = "P") {
        OwnedKey key(machine.registry_);
        const KeyHandle root = user.empty() ? KeyHandle::currentUser : KeyHandle::users;
        machine.registry_.createKey(root, user.empty() ? kKey : user + "\\" + kKey, {}, kKeyFull, key.receive());
        EXPECT_EQ(machine.registry_.setValue(key.get(), name, ValueType::sz, bytes), kSuccess);
    }

    RuntimeMachine machine{true};
    Installation at{machine.session, machine.registry_, machine.engine};
};

TEST_F(InstallerProperties, AreReadFromTheInstallerOrTheSavedValues) {
    using namespace std::literals;
    // clang-format off
    const struct {
        const char* why; bool deferred; const char* sid; const char* savedFor; std::string_view saved;
        const char* installers; std::uint32_t room; Status status; const char* text; std::uint32_t size;
        const char* name = "P";
    } rows[] = {
        {"immediate: the installer's, its size without the NUL",   false, "",       nullptr, ""sv,      "live", 1024, kSuccess, "live", 4},
        {"immediate: what was saved is not looked at",             false, "",       "",      "old\0"sv, "live", 5,    kSuccess, "live", 4},
        {"immediate: too small, the installer's hint",             false, "",       nullptr, ""sv,      "live", 4,    kMoreData, "", 8},
        {"deferred: saved wins, its size counts the NUL",          true,  "",       "",      "old\0"sv, "live", 1024, kSuccess, "old", 4},
        {"deferred: in the key of the user who installs",          true,  "S-1-5",  "S-1-5", "old\0"sv, "",     4,    kSuccess, "old", 4},
        {"deferred: that user has no key here, so the caller's",   true,  "S-1-8",  "",      "old\0"sv, "",     1024, kSuccess, "old", 4},
        {"deferred: nothing saved, a private property is empty",   true,  "",       nullptr, ""sv,      "live", 1024, kSuccess, "", 0},
        {"deferred: saved empty reads empty",                      true,  "",       "",      "\0"sv,    "live", 1024, kSuccess, "", 1},
        {"deferred: saved does not fit, the installer is asked",   true,  "",       "",      "old\0"sv, "",     3,    kSuccess, "", 0},
        {"deferred: saved by somebody without a NUL is terminated", true, "",       "",      "old"sv,   "",     4,    kSuccess, "old", 3},
        {"deferred: what the installer has is never the saved one", true, "",     "",      "old\0"sv, "live", 1024, kSuccess, "live", 4, "CustomActionData"},
        {"deferred: which counts where the installer has none",    true,  "",       "",      "old\0"sv, "",     1024, kSuccess, "old", 4, "CustomActionData"},
        {"deferred: and is none where the NUL does not fit",       true,  "",       "",      "old"sv,   "",     3,    kSuccess, "", 0},
    };
    // clang-format on
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        machine.session.properties = {{row.name, row.installers}, {"UserSID", row.sid}};
        machine.session.isScheduled = row.deferred;
        if (row.savedFor != nullptr) {
            save(row.savedFor, row.saved, row.name);
        }
        std::string room(row.room + 8, '#');
        std::uint32_t size = row.room;
        EXPECT_EQ(iMsiGetProperty(at, row.name, room.data(), &size), row.status);
        EXPECT_EQ(size, row.size);
        if (row.status == kSuccess) {
            EXPECT_STREQ(room.c_str(), row.text);
        }
        EXPECT_EQ(room.substr(row.room), "########") << "nothing is written behind the buffer";
        machine.session.isScheduled = false;
        EXPECT_EQ(iDeleteSavedProperties(at), kSuccess);
    }
}

TEST_F(InstallerProperties, RefusalsDependOnTheKindOfAction) {
    EXPECT_EQ(iMsiGetProperty(at, nullptr, nullptr, nullptr), kMissingItem);
    machine.session.isRollback = true;
    EXPECT_EQ(iMsiGetProperty(at, nullptr, nullptr, nullptr), kInvalidParameter) << "a rollback is deferred too";
    EXPECT_EQ(iMsiSetProperty(at, "P", "x"), kFunctionFailed) << "the installer's answer to a rollback";
    EXPECT_EQ(iSavePropertiesForDeferred(at), kNoInstallationDatabase);
    EXPECT_NE(machine.logText().find("Note: iSavePropertiesForDeferred, step 10: error 6045: "), std::string::npos);
}

TEST_F(InstallerProperties, SavesEverythingThatDeferredActionsNeed) {
    const std::string longest(1023, 'l');
    auto& properties = machine.session.properties;
    properties = {
        {"UserSID", "S-1-5"},        {"Z_LAST", "z"},   {"A_FIRST", "a"},       {"LONGEST", longest},
        {"TOO_LONG", longest + "m"}, {"REMOVE", "ALL"}, {"DLFM_PWD", "secret"}, {"HUGE", std::string(100000, 'h')}};
    properties["PROD"] = "PROD_DOCE";
    machine.session.tableRows = {"Z_LAST", "A_FIRST", "", "LONGEST", "TOO_LONG", "HUGE", "UNSET"};
    machine.session.features = {{"ADMIN_SERVER.bin", {FeatureState::local, FeatureState::absent}},
                                {"LDAP.bin", {FeatureState::absent, FeatureState::local}},
                                {"VS_DOT_NET.bin", {FeatureState::absent, FeatureState::absent}},
                                {"BASE_CLIENT.bin", {FeatureState::local, FeatureState::source}}};
    machine.session.actions["ResolveSource"] = [&] { properties["SOURCEDIR"] = "D:\\"; };
    machine.engine.takeResponses({{"PROD", "PROD_ESE"}, {"prod", "PROD_ESE"}, {"FILE", "C:\\p"}, {"EMPTY", ""}});
    save("S-1-5", "of an earlier installation");
    const std::string log = machine.logged([&] { EXPECT_EQ(iSavePropertiesForDeferred(at), kSuccess); });
    EXPECT_NE(log.find("Note: iMsiGetProperty: TOO_LONG, status 234\n"), std::string::npos) << log;
    EXPECT_NE(log.find("Note: MsiDoAction: ResolveSource, status 0\nNote: iMsiGetProperty: SOURCEDIR, status 0\n"),
              std::string::npos);
    EXPECT_EQ(log.find("secret"), std::string::npos) << "values stay out of the log";
    EXPECT_EQ(properties["BASE_CLIENT_BIN_SELECTED"], "Y");
    EXPECT_EQ(properties["SOURCEDIR"], "D:\\");

    const std::string key = "S-1-5\\" + kKey;
    std::string expected;
    const auto add = [&](const std::string& name, const std::string& value) {
        const std::string line = key + " : " + name + " = 1:" + value + "\\x00\n";
        expected += expected.find(line) == std::string::npos ? line : "";
    };
    // The values of an earlier installation are deleted.
    for (const char* name : {"Z_LAST", "A_FIRST", "LONGEST", "UNSET"}) {
        add(name, properties[name]);
    }
    for (const char* name : kSavedPropertyNames) {
        add(name, properties[name]);  // some are in the list twice
    }
    add("ADMIN_SERVER.bin_SELECT_STATE", "DESELECTED");
    add("LDAP.bin_SELECT_STATE", "SELECTED");
    add("BASE_CLIENT.bin_SELECT_STATE", "SELECTED");
    add("PROP_RSP_FILE", "C:\\p");
    EXPECT_EQ(dumpRegistry(machine.registry_, KeyHandle::users, key), expected);

    machine.session.isScheduled = true;
    properties["Z_LAST"] = "changed since";
    char room[kPropertySize];
    std::uint32_t size = sizeof room;
    const char* earlier = iSubstituteCopyName("$CurrentInstallationName$", "X", 0, nullptr);
    EXPECT_STREQ(earlier, "X");
    EXPECT_EQ(iMsiGetProperty(at, "Z_LAST", room, &size), kSuccess);
    EXPECT_STREQ(room, "z");
    EXPECT_EQ(earlier, kKey) << "reading takes the shared buffer of the substitution";
    EXPECT_EQ(iDeleteSavedProperties(at), kSuccess);
    EXPECT_EQ(dumpRegistry(machine.registry_, KeyHandle::users, key), "[" + key + "] cannot be opened\n");
    EXPECT_EQ(iDeleteSavedProperties(at), kSuccess) << "nothing saved is a successful delete";
}

}  // namespace
}  // namespace kz7::test
