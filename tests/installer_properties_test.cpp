// Installer properties in immediate and deferred custom actions, on a session that allows what the installer allows.
#include <gtest/gtest.h>

#include <set>

#include "install/platform/faulty/installer_session.h"
#include "install/platform/faulty/registry.h"
#include "install/runtime/copy_name.h"
#include "install/runtime/installer_properties.h"
#include "install/runtime/saved_property_names.h"
#include "tests/support/registry_dump.h"
#include "tests/support/runtime_machine.h"

namespace kz7::test {
namespace {

const std::string kKey = "SOFTWARE\\NVQ\\KZ7\\TEMP\\PROPERTIES95";
const std::string kUser = "S-1-5-21-7";

class InstallerProperties : public testing::Test {
protected:
    InstallerProperties() { machine.openLog(); }

    void makeKey(KeyHandle root, const std::string& path) {
        OwnedKey key(machine.registry_);
        ASSERT_EQ(machine.registry_.createKey(root, path, {}, kKeyFull, key.receive()), kSuccess);
    }
    void save(KeyHandle root, const std::string& user, const std::string& name, std::string_view bytes) {
        OwnedKey key(machine.registry_);
        const std::string path = user.empty() ? kKey : user + "\\" + kKey;
        ASSERT_EQ(machine.registry_.createKey(root, path, {}, kKeyFull, key.receive()), kSuccess);
        ASSERT_EQ(machine.registry_.setValue(key.get(), name, ValueType::sz, bytes), kSuccess);
    }
    // A line for each saved value: "name = type:data".
    std::string saved(KeyHandle root, const std::string& user = {}) {
        const std::string key = user.empty() ? kKey : user + "\\" + kKey;
        std::string dump = dumpRegistry(machine.registry_, root, key);
        if (dump.ends_with("cannot be opened\n")) {
            return {};
        }
        for (std::size_t place = 0; (place = dump.find(key + " : ", place)) != std::string::npos;) {
            dump.erase(place, key.size() + 3);
        }
        return dump;
    }
    void becomeDeferred() { machine.session.isScheduled = true; }

    RuntimeMachine machine{true};
    Installation at{machine.session, machine.registry_, machine.engine};
};

TEST_F(InstallerProperties, AreReadFromTheInstallerOrFromWhatWasSaved) {
    using namespace std::literals;
    makeKey(KeyHandle::users, kUser);
    const std::string long1022(1022, 'l');
    const std::string long1023(1023, 'l');
    // clang-format off
    const struct {
        const char* why; bool deferred; const char* sid; KeyHandle root; std::string_view savedBytes;
        std::string installerValue; std::uint32_t room; Status status; std::string text; std::uint32_t size;
    } rows[] = {
        {"immediate: the installer's, its size without the NUL", false, "", KeyHandle::none, ""sv, "live", 1024, kSuccess, "live", 4},
        {"immediate: what was saved is not looked at", false, "", KeyHandle::currentUser, "old\0"sv, "live", 1024, kSuccess, "live", 4},
        {"immediate: the value with its NUL just fits", false, "", KeyHandle::none, ""sv, "live", 5, kSuccess, "live", 4},
        {"immediate: too small, the installer's hint", false, "", KeyHandle::none, ""sv, "live", 4, kMoreData, "", 8},
        {"deferred: saved wins, its size counts the NUL", true, "", KeyHandle::currentUser, "old\0"sv, "live", 1024, kSuccess, "old", 4},
        {"deferred: in the key of the user who installs", true, "S-1-5-21-7", KeyHandle::users, "old\0"sv, "", 1024, kSuccess, "old", 4},
        {"deferred: that user has no key here, so the caller's", true, "S-1-5-21-8", KeyHandle::currentUser, "old\0"sv, "", 1024, kSuccess, "old", 4},
        {"deferred: nothing saved, a private property is empty", true, "", KeyHandle::none, ""sv, "live", 1024, kSuccess, "", 0},
        {"deferred: saved empty reads empty", true, "", KeyHandle::currentUser, "\0"sv, "live", 1024, kSuccess, "", 1},
        {"deferred: saved does not fit, the installer is asked with the caller's size", true, "", KeyHandle::currentUser, "old\0"sv, "", 3, kSuccess, "", 0},
        {"deferred: saved by somebody without a NUL is terminated", true, "", KeyHandle::currentUser, "old"sv, "", 4, kSuccess, "old", 3},
        {"deferred: and is none where the NUL does not fit", true, "", KeyHandle::currentUser, "old"sv, "", 3, kSuccess, "", 0},
        {"immediate: the longest value", false, "", KeyHandle::none, ""sv, long1023, 1024, kSuccess, long1023, 1023},
        {"immediate: one more", false, "", KeyHandle::none, ""sv, long1023 + "m", 1024, kMoreData, "", 2048},
    };
    // clang-format on
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        machine.session.properties = {{"P", row.installerValue}, {"UserSID", row.sid}};
        machine.session.isScheduled = row.deferred;
        if (row.root != KeyHandle::none) {
            save(row.root, row.root == KeyHandle::users ? kUser : "", "P", row.savedBytes);
        }
        std::string room(row.room + 8, '#');
        std::uint32_t size = row.room;
        EXPECT_EQ(iMsiGetProperty(at, "P", room.data(), &size), row.status);
        EXPECT_EQ(size, row.size);
        if (row.status == kSuccess) {
            EXPECT_STREQ(room.c_str(), row.text.c_str());
        }
        EXPECT_EQ(room.substr(row.room), "########") << "nothing is written behind the buffer";
        machine.session.isScheduled = false;
        EXPECT_EQ(iDeleteSavedProperties(at), kSuccess);
    }
    EXPECT_EQ(machine.registry_.openHandles(), 0U);
}

TEST_F(InstallerProperties, MissingArgumentsDependOnTheKindOfAction) {
    char room[8];
    std::uint32_t size = sizeof room;
    // clang-format off
    const struct { const char* why; bool scheduled; bool rollback; const char* name; char* buffer; std::uint32_t* size; Status status; } rows[] = {
        {"immediate, no name",   false, false, nullptr, room,    &size,   kMissingItem},
        {"immediate, no buffer", false, false, "P",     nullptr, &size,   kMissingItem},
        {"immediate, no size",   false, false, "P",     room,    nullptr, kInvalidParameter},
        {"deferred, no name",    true,  false, nullptr, room,    &size,   kInvalidParameter},
        {"deferred, no buffer",  true,  false, "P",     nullptr, &size,   kInvalidParameter},
        {"rollback, no size",    false, true,  "P",     room,    nullptr, kInvalidParameter},
    };
    // clang-format on
    for (const auto& row : rows) {
        machine.session.isScheduled = row.scheduled;
        machine.session.isRollback = row.rollback;
        EXPECT_EQ(iMsiGetProperty(at, row.name, row.buffer, row.size), row.status) << row.why;
    }
    EXPECT_EQ(iMsiSetProperty(at, "P", "x"), kFunctionFailed) << "the installer's answer to a rollback";
}

TEST_F(InstallerProperties, ReadingTakesTheSharedBufferOfTheSubstitution) {
    const char* earlier = iSubstituteCopyName("a\\$CurrentInstallationName$", "X", 0, nullptr);
    ASSERT_STREQ(earlier, "a\\X");
    becomeDeferred();
    char room[8];
    std::uint32_t size = sizeof room;
    iMsiGetProperty(at, "P", room, &size);
    EXPECT_EQ(earlier, kKey);
}

TEST_F(InstallerProperties, EverythingThatDeferredActionsNeedIsSaved) {
    const std::string longest(1023, 'l');
    machine.session.properties = {{"UserSID", kUser},
                                  {"Z_LAST", "z"},
                                  {"A_FIRST", "a"},
                                  {"LONGEST", longest},
                                  {"TOO_LONG", longest + "m"},
                                  {"HUGE", std::string(100000, 'h')},
                                  {"REMOVE", "ALL"},
                                  {"DLFM_PWD", "secret"}};
    machine.session.tableRows = {"Z_LAST", "A_FIRST", "", "LONGEST", "TOO_LONG", "HUGE", "UNSET"};
    machine.session.features = {{"ADMIN_SERVER.bin", {FeatureState::local, FeatureState::absent}},
                                {"LDAP.bin", {FeatureState::absent, FeatureState::local}},
                                {"VS_DOT_NET.bin", {FeatureState::absent, FeatureState::absent}},
                                {"BASE_CLIENT.bin", {FeatureState::local, FeatureState::source}}};
    machine.session.actions["ResolveSource"] = [&] { machine.session.properties["SOURCEDIR"] = "D:\\"; };
    machine.engine.takeResponses({{"PROD", "PROD_DOCE"}, {"prod", "PROD_DOCE"}, {"FILE", "C:\\p"}, {"EMPTY", ""}});
    makeKey(KeyHandle::users, kUser);
    ASSERT_EQ(iSavePropertiesForDeferred(at), kSuccess);
    EXPECT_EQ(machine.session.properties["BASE_CLIENT_BIN_SELECTED"], "Y");

    std::string expected;
    const auto add = [&](const std::string& name, const std::string& value) {
        expected += name + " = 1:" + value + "\\x00\n";
    };
    for (const auto& [name, value] : std::vector<std::pair<std::string, std::string>>{
             {"Z_LAST", "z"}, {"A_FIRST", "a"}, {"LONGEST", longest}, {"UNSET", ""}}) {
        add(name, value);
    }
    std::set<std::string> twice;
    for (const std::string name : kSavedPropertyNames) {
        if (twice.insert(name).second) {
            add(name, name == "REMOVE"                     ? "ALL"
                      : name == "DLFM_PWD"                 ? "secret"
                      : name == "BASE_CLIENT_BIN_SELECTED" ? "Y"
                      : name == "SOURCEDIR"                ? "D:\\"
                                                           : "");
        }
    }
    add("ADMIN_SERVER.bin_SELECT_STATE", "DESELECTED");
    add("LDAP.bin_SELECT_STATE", "SELECTED");
    add("BASE_CLIENT.bin_SELECT_STATE", "SELECTED");
    add("PROP_RSP_FILE", "C:\\p");
    EXPECT_EQ(saved(KeyHandle::users, kUser), expected);
    const std::string log = machine.logText();
    EXPECT_NE(log.find("Note: iMsiGetProperty: UserSID, status 0\n"
                       "Note: iMsiSetProperty: BASE_CLIENT_BIN_SELECTED, status 0\n"
                       "Note: iMsiGetProperty: TOO_LONG, status 234\n"),
              std::string::npos)
        << log;
    EXPECT_EQ(log.find("secret"), std::string::npos) << "values stay out of the log";

    becomeDeferred();
    machine.session.properties["Z_LAST"] = "changed since";
    char room[kPropertySize];
    std::uint32_t size = sizeof room;
    EXPECT_EQ(iMsiGetProperty(at, "Z_LAST", room, &size), kSuccess);
    EXPECT_STREQ(room, "z");
    EXPECT_EQ(iDeleteSavedProperties(at), kSuccess);
    EXPECT_EQ(saved(KeyHandle::users, kUser), "");
    EXPECT_EQ(iDeleteSavedProperties(at), kSuccess) << "nothing saved is a successful delete";
    EXPECT_EQ(machine.session.openHandles(), 0U);
    EXPECT_EQ(machine.registry_.openHandles(), 0U);
}

TEST_F(InstallerProperties, WithoutADatabaseNothingIsSaved) {
    for (const bool deferred : {false, true}) {
        machine.session.isScheduled = deferred;
        machine.session.hasDatabase = deferred;
        EXPECT_EQ(iSavePropertiesForDeferred(at), kNoInstallationDatabase);
    }
    EXPECT_EQ(saved(KeyHandle::currentUser), "");
    EXPECT_NE(machine.logText().find("Note: iSavePropertiesForDeferred, step 10: error 6045: "), std::string::npos);
}

// Every call fails once, and once for good: saving ends with the failure of a step that gives the table and goes on
// past any other, nothing stays open, and what could be saved is there.
TEST(SavingProperties, AnyCallMayFail) {
    for (const bool forGood : {false, true}) {
        std::uint64_t calls = 0;
        for (std::uint64_t call = 1; call <= calls + 1; ++call) {
            RuntimeMachine machine(true);
            machine.session.properties = {{"A", "a"}, {"B", "b"}};
            machine.session.tableRows = {"A", "B"};
            machine.session.features = {{"LDAP.bin", {FeatureState::absent, FeatureState::local}}};
            FaultCounter faults(call, forGood, kGeneralFailure);
            FaultyInstallerSession session(machine.session, faults);
            FaultyRegistry registry(machine.registry_, faults);
            const Installation at{session, registry, machine.engine};
            const Status status = iSavePropertiesForDeferred(at);
            const std::string& failed = faults.failed();
            const std::string row = failed + " is call " + std::to_string(call) + (forGood ? " for good" : "");
            EXPECT_EQ(machine.session.openHandles(), 0U) << row;
            EXPECT_EQ(machine.registry_.openHandles(), 0U) << row;
            if (!forGood) {
                const bool stops = failed == "activeDatabase" || failed == "openView" || failed == "executeView";
                EXPECT_EQ(status, failed == "activeDatabase"         ? kNoInstallationDatabase
                                  : stops || failed == "fetchRecord" ? kGeneralFailure
                                                                     : kSuccess)
                    << row;
                OwnedKey key(machine.registry_);
                EXPECT_EQ(machine.registry_.openKey(KeyHandle::currentUser, kKey, kKeyRead, key.receive()) == kSuccess,
                          !stops && failed != "createKey")
                    << row;
            }
            if (failed.empty()) {
                break;
            }
            calls = call;
        }
        EXPECT_GT(calls, 400U);
    }
}

}  // namespace
}  // namespace kz7::test
