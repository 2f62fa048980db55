// The contract of the registry port, for the registry in memory and this machine's.
#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <numeric>
#include <sstream>

#include "install/src/registry/registry_access.h"
#include "tests/support/backends.h"

namespace kz7::test {
namespace {

class RegistryContract : public Contract {
protected:
    RegistryContract() { enter(kScratch); }
    ~RegistryContract() override {
        key_.reset();
        for (const char* scratch : {kScratch, kScratch32}) {
            deleteTree(registry_, KeyHandle::localMachine, scratch, 0, {}, {});
        }
    }

    // Creates a key and makes it the one that the helpers below work in.
    void enter(const std::string& path) {
        EXPECT_EQ(registry_.createKey(KeyHandle::localMachine, path, {}, kKeyFull, key_.receive()), kSuccess);
        at_ = key_.get();
    }
    OwnedKey opened(const std::string& path, AccessMask access) {
        OwnedKey key(registry_);
        EXPECT_EQ(registry_.openKey(at_, path, access, key.receive()), kSuccess) << path;
        return key;
    }
    Status make(const std::string& path, const std::string& keyClass = {}) {
        OwnedKey key(registry_);
        return registry_.createKey(at_, path, keyClass, kKeyFull, key.receive());
    }
    Status open(const std::string& path) {
        OwnedKey key(registry_);
        return registry_.openKey(at_, path, kKeyRead, key.receive());
    }
    Status remove(const std::string& path) { return registry_.deleteKey(at_, path, 0); }
    Status set(const std::string& name, const std::string& data, ValueType type = ValueType::binary) {
        return registry_.setValue(at_, name, type, data);
    }
    Status unset(const std::string& name) { return registry_.deleteValue(at_, name); }

    // The bytes of a value; the name of a key (with its class) or of a value at an index; all names. Or the status in
    // angle brackets.
    std::string get(const std::string& name) {
        const Status status = registry_.queryValue(at_, name, nullptr, room_);
        return status == kSuccess ? std::string(room_.view()) : "<" + std::to_string(status) + ">";
    }
    std::string nameAt(bool ofKeys, std::size_t place) {
        const auto index = static_cast<std::uint32_t>(place);
        FixedBuffer<16> keyClass;
        const Status status = ofKeys ? registry_.enumerateKey(at_, index, name_, &keyClass)
                                     : registry_.enumerateValue(at_, index, name_, nullptr, nullptr);
        return status != kSuccess   ? "<" + std::to_string(status) + ">"
               : keyClass.size != 0 ? std::string(name_.view()) + ":" + keyClass.data
                                    : std::string(name_.view());
    }
    std::string names(bool ofKeys) {
        std::string all;
        std::string name;
        for (std::size_t index = 0; (name = nameAt(ofKeys, index)) != "<259>"; ++index) {
            all += (index == 0 ? "" : ",") + name;
        }
        return all;
    }

    // Takes steps as "verb name data = result; ..." and expects each result; "@" is the empty name.
    void expectSteps(const std::string& steps, const char* why) {
        std::istringstream all(steps);
        for (std::string step; std::getline(all >> std::ws, step, ';');) {
            const std::size_t sign = step.find(" = ");
            std::string verb, name, data;
            std::istringstream(step.substr(0, sign)) >> verb >> name >> data;
            EXPECT_EQ(step.substr(0, sign) + " = " + result(verb, name == "@" ? "" : name, data), step) << why;
        }
    }
    std::string result(const std::string& verb, const std::string& name, const std::string& data) {
        if (verb == "get") {
            return get(name);
        }
        if (verb == "keys" || verb == "values") {
            return names(verb == "keys");
        }
        if (verb == "key" || verb == "value") {
            return nameAt(verb == "key", std::stoul(name));
        }
        const std::map<std::string, std::function<Status()>> verbs = {
            {"make", [&] { return make(name, data); }}, {"open", [&] { return open(name); }},
            {"remove", [&] { return remove(name); }},   {"set", [&] { return set(name, data); }},
            {"unset", [&] { return unset(name); }},     {"commit", [&] { return registry_.commit(); }}};
        return std::to_string(verbs.at(verb)());
    }

    static constexpr auto kScratch = "SOFTWARE\\KZ7ContractTest";
    static constexpr auto kScratch32 = "SOFTWARE\\Wow6432Node\\KZ7ContractTest";
    IRegistryStore& registry_ = platform_.registry();
    Differences differences_ = backend_->differences();
    OwnedKey key_{registry_};
    KeyHandle at_ = KeyHandle::none;  // the key that the helpers work in
    FixedBuffer<kMaxValueName + 1> name_;
    FixedBuffer<200'000> room_;
};

INSTANTIATE_TEST_SUITE_P(Stores, RegistryContract, testing::ValuesIn(kBackends));

TEST_P(RegistryContract, NamesOrderAndEnumerationFollowTheContract) {
    const std::string folded = differences_.foldsBeyondAscii ? "0" : "2";
    const std::string keyClass = differences_.passesClassesOn ? "late" : "its";
    const std::string parentClass = differences_.passesClassesOn ? ":its" : "";
    const std::string keyOrder = differences_.ordersKeysByLowerCase ? "1,_x,A,aa,b,Z1" : "1,A,aa,b,Z1,_x";
    const std::string valueOrder = differences_.ordersValuesByName ? "_x,A,b,Z0" : "b,_x,A,Z0";
    // clang-format off
    const struct { const char* why; std::string steps; } rows[] = {
        {"names of keys compare without case, the first spelling stays",
         "make Alpha\\Beta = 0; make aLPHA = 0; open ALPHA\\bETA = 0; keys = Alpha; remove ALPHA\\BETA = 0; open Alpha\\Beta = 2"},
        {"names of values compare without case",
         "set Name 1 = 0; set NAME 2 = 0; get nAme = 2; values = Name; set @ 3 = 0; get @ = 3; unset name = 0; values = ; get Name = <2>"},
        {"letters beyond ASCII", "make \xC3\x84 = 0; open \xC3\xA4 = " + folded + "; remove \xC3\x84 = 0"},
        {"an enumeration of keys sees changes before, at and after its index, and a commit loses none",
         "make b = 0; make c = 0; make d = 0; key 0 = b; remove b = 0; key 0 = c; key 1 = d; make e = 0; key 2 = e; "
         "make f = 0; key 3 = f; key 4 = <259>; key 1 = d; remove c = 0; key 1 = e; key 2 = f; key 0 = d; remove f = 0; "
         "key 2 = <259>; key 1 = e; make a = 0; key 1 = d; key 2 = e; commit = 0; key 2 = e; key 3 = <259>"},
        {"an enumeration of values does the same",
         "set b = 0; set c = 0; set d = 0; value 0 = b; unset b = 0; value 0 = c; value 1 = d; set e = 0; value 2 = e; "
         "set f = 0; value 3 = f; value 4 = <259>; value 1 = d; unset c = 0; value 1 = e; value 2 = f; value 0 = d; "
         "unset f = 0; value 2 = <259>; value 1 = e; commit = 0; value 1 = e"},
        {"a value that takes the place of the last ones is enumerated",
         "set a = 0; set b = 0; commit = 0; unset a = 0; value 0 = b; unset b = 0; set c = 0; value 0 = c"},
        {"subkeys enumerate by name",
         "make b = 0; make _x = 0; make A = 0; make Z1 = 0; make aa = 0; make 1 = 0; keys = " + keyOrder},
        {"values enumerate in insertion order",
         "set b = 0; set _x = 0; set A = 0; set z0 = 0; set a again = 0; unset Z0 = 0; set Z0 = 0; values = " + valueOrder},
        {"an existing key keeps its class", "make One its = 0; make One late = 0; keys = One:" + keyClass},
        {"parents that are created have no class", "make Two\\Three its = 0; keys = Two" + parentClass},
        {"a key with subkeys is not deleted; the empty path is the key itself",
         "make One\\Two = 0; remove One = 5; open One\\Two = 0; remove One\\Absent = 2; remove One\\Two = 0; "
         "remove One\\Two = 2; remove One = 0; open One = 2; remove @ = 0; key 0 = <1018>"},
    };
    // clang-format on
    for (const auto& row : rows) {
        enter(std::string(kScratch) + "\\" + std::to_string(&row - rows));
        expectSteps(row.steps, row.why);
    }
}

TEST_P(RegistryContract, AHandleAllowsWhatItsRightsAndItsKeyAllow) {
    expectSteps("make Gone = 0; make There\\Below = 0; set v x = 0", "set-up");
    OwnedKey gone = opened("Gone", kKeyFull);
    const OwnedKey query = opened("", kKeyQueryValue);
    const OwnedKey setting = opened("", kKeySetValue);
    const OwnedKey listing = opened("", kKeyEnumerateSubkeys);
    expectSteps("remove Gone = 0; make Gone = 0", "another key with that name");
    const KeyHandle shut = opened("", kKeyFull).get();
    // clang-format off
    const struct { const char* why; KeyHandle key; const char* steps; } rows[] = {
        {"a closed handle",      shut,            "open There = 6; make There = 6; get v = <6>; set v y = 6; unset absent = 6; key 0 = <6>; value 0 = <6>; remove Absent = 6"},
        {"the null handle",      KeyHandle::none, "open There = 6; make There = 6; get v = <6>; set v y = 6; unset absent = 6; key 0 = <6>; value 0 = <6>; remove Absent = 6"},
        {"of a deleted key",     gone.get(),      "open x = 1018; make x = 1018; get v = <1018>; set v y = 1018; unset v = 1018; key 0 = <1018>; value 0 = <1018>; remove x = 1018"},
        {"with every right",     at_,             "open There = 0; make There = 0; get v = x; set v y = 0; unset absent = 2; key 0 = Gone; value 0 = v; remove Absent = 2"},
        {"to query values only", query.get(),     "open There = 0; make There = 0; get v = y; set v y = 5; unset absent = 5; key 0 = <5>; value 0 = v; remove Absent = 2"},
        {"to set values only",   setting.get(),   "open There = 0; make There = 0; get v = <5>; set v y = 0; unset absent = 2; key 0 = <5>; value 0 = <5>; remove Absent = 2"},
        {"to list keys only",    listing.get(),   "open There = 0; make There = 0; get v = <5>; set v y = 5; unset absent = 5; key 0 = Gone; value 0 = <5>; remove Absent = 2"},
    };
    // clang-format on
    for (const auto& row : rows) {
        at_ = row.key;
        expectSteps(row.steps, row.why);
    }
    EXPECT_EQ(registry_.closeKey(shut), kInvalidHandle);
    EXPECT_EQ(registry_.closeKey(KeyHandle::none), kInvalidHandle);
    const KeyHandle deleted = gone.get();
    gone.leaveOpen();
    EXPECT_EQ(registry_.closeKey(deleted), kSuccess) << "a handle of a deleted key can still be closed";
    for (const KeyHandle root : {KeyHandle::localMachine, KeyHandle::currentUser, KeyHandle::users}) {
        EXPECT_EQ(registry_.closeKey(root), kSuccess);
        at_ = root;
        EXPECT_NE(nameAt(true, 0), "<6>") << "a root stays open";
    }
}

// A character that has three bytes in UTF-8 and one unit in UTF-16, so many times.
std::string repeated(std::size_t times) {
    std::string text;
    while (times-- > 0) {
        text += "\xE8\xA1\xA8";
    }
    return text;
}

TEST_P(RegistryContract, PathsAreCheckedBeforeTheyAreUsed) {
    ASSERT_EQ(make("A\\B\\C"), kSuccess);
    const std::string longest(kMaxKeyName, 'k');
    // clang-format off
    const struct { const char* why; std::string path; Status status; } rows[] = {
        {"doubled separators",          "A\\\\b\\\\\\C",               kSuccess},
        {"a trailing separator",        "A\\B\\",                      kSuccess},
        {"a leading separator",         "\\A\\B",                      kBadPathname},
        {"nothing but a separator",     "\\",                          kBadPathname},
        {"the longest name, missing",   longest,                       kFileNotFound},
        {"a name too long",             longest + "k",                 kInvalidParameter},
        {"a long name below a key",     "A\\" + longest + "k" + "\\C", kInvalidParameter},
        {"255 characters, three bytes", repeated(255),                 kFileNotFound},
        {"256 characters, three bytes", repeated(256),                 kInvalidParameter},
        {"a NUL",                       std::string("A\0B", 3),        kInvalidParameter},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(open(row.path), row.status) << row.why;
        if (row.status != kSuccess) {
            EXPECT_EQ(remove(row.path), row.status) << row.why;
        }
        if (row.status != kFileNotFound) {
            EXPECT_EQ(make(row.path), row.status) << row.why;
        }
    }
    EXPECT_EQ(make(longest + "\\" + longest + "\\" + longest), kSuccess);
    EXPECT_EQ(open(longest + "\\" + longest + "\\" + longest), kSuccess);
    EXPECT_EQ(names(true), "A," + longest) << "a refused path creates nothing";
}

TEST_P(RegistryContract, ValuesPreserveEveryByte) {
    std::string allBytes(256, '\0');
    std::iota(allBytes.begin(), allBytes.end(), '\0');
    // clang-format off
    const struct { const char* why; ValueType type; std::string data; } rows[] = {
        {"every byte",             ValueType::binary,          allBytes},
        {"nothing",                ValueType::binary,          ""},
        {"100,000 bytes",          ValueType::binary,          std::string(100'000, '\xFF')},
        {"a text of a path",       ValueType::expandSz,        std::string("%PATH%\\\xC3\xA9\0", 10)},
        {"no NUL terminator", ValueType::sz,              "text"},
        {"other scripts, two units, unpaired surrogates", ValueType::multiSz, repeated(250) + "\xF0\x9F\x98\x80\xED\xA0\x80x\xED\xB0\x80"},
        {"texts",                  ValueType::multiSz,         std::string("one\0two\0\0", 9)},
        {"an unknown type",        static_cast<ValueType>(77), "bytes"},
        {"a text and half a unit", oddText(ValueType::sz),     std::string("a\0b", 3)},
        {"half a unit",            oddText(ValueType::multiSz), "a"},
    };
    // clang-format on
    for (const auto& row : rows) {
        ASSERT_EQ(set("v", row.data, row.type), kSuccess) << row.why;
        for (const bool listed : {false, true}) {
            ValueType type{};
            EXPECT_EQ(listed ? registry_.enumerateValue(at_, 0, name_, &type, &room_)
                             : registry_.queryValue(at_, "v", &type, room_),
                      kSuccess)
                << row.why;
            const bool isCut = !listed && row.type != plainType(row.type);
            EXPECT_EQ(type, isCut ? plainType(row.type) : row.type) << row.why;
            EXPECT_TRUE(room_.view() == (isCut ? row.data.substr(0, row.data.size() / 2) : row.data))
                << row.why << ": " << room_.size << " bytes";
        }
    }
}

TEST_P(RegistryContract, AShortBufferReportsTheSizeAndStaysEmpty) {
    expectSteps("set value 12345 = 0; make subkey class = 0", "set-up");
    ValueType type{};
    // clang-format off
    const struct { const char* why; std::string_view whole; bool terminated; std::function<Status(Buffer&)> read; } rows[] = {
        {"a value's data",   "12345",  false, [&](Buffer& room) { return registry_.queryValue(at_, "value", &type, room); }},
        {"listed data",      "12345",  false, [&](Buffer& room) { return registry_.enumerateValue(at_, 0, name_, &type, &room); }},
        {"a value's name",   "value",  true,  [&](Buffer& room) { return registry_.enumerateValue(at_, 0, room, &type, nullptr); }},
        {"a key's class",    "class",  true,  [&](Buffer& room) { return registry_.enumerateKey(at_, 0, name_, &room); }},
        {"a key's name",     "subkey", true,  [&](Buffer& room) { return registry_.enumerateKey(at_, 0, room, nullptr); }},
    };
    // clang-format on
    for (const auto& row : rows) {
        for (const std::uint32_t capacity : {0U, 1U, 4U, 5U, 6U, 7U, 16U}) {
            char bytes[16];
            Buffer room(bytes, capacity);
            type = ValueType::none;
            const bool fits = capacity >= row.whole.size() + (row.terminated ? 1 : 0);
            EXPECT_EQ(row.read(room), fits ? kSuccess : kMoreData) << row.why << " in " << capacity;
            EXPECT_EQ(room.view(), fits ? row.whole : "") << row.why << " in " << capacity;
            EXPECT_TRUE(fits || type == ValueType::none) << row.why << " in " << capacity;
            EXPECT_TRUE(row.terminated || room.size == row.whole.size()) << row.why << " in " << capacity;
        }
    }
}

TEST_P(RegistryContract, NamesHoldAnyCharacterButSeparatorAndNul) {
    const std::string longest(kMaxValueName, 'v');
    const std::string wide = repeated(250);
    for (const std::string name : {"with blanks", " leading", "trailing ", "..", "100%d%s%%", "quote\"s'",
                                   "a/b?*<>|:", "\xC3\xA9\xC3\xB1", "[x]=y;z", "tab\tfeed\n", "\xF0\x9F\x98\x80",
                                   "\xED\xA0\x80x\xED\xB0\x80", "back\\slash", wide.c_str(), longest.c_str()}) {
        if (name != longest && name.find('\\') == std::string::npos) {
            EXPECT_EQ(make(name), kSuccess) << name;
            EXPECT_EQ(names(true), name);
            EXPECT_EQ(remove(name), kSuccess) << name;
        }
        EXPECT_EQ(set(name, "x"), kSuccess) << name;
        EXPECT_EQ(get(name), "x") << name;
        EXPECT_EQ(names(false), name);
        EXPECT_EQ(unset(name), kSuccess) << name;
    }
    for (const std::string& name : {longest + "v", std::string("a\0b", 3)}) {
        EXPECT_EQ(set(name, "x"), kInvalidParameter) << name.size();
        EXPECT_EQ(get(name), "<87>") << name.size();
        EXPECT_EQ(unset(name), kInvalidParameter) << name.size();
    }
    EXPECT_EQ(names(false), "");
}

TEST_P(RegistryContract, TheViewBitSelectsTheOtherTree) {
    // Opens the path and that of the 32-bit tree; each with no view, the 64-bit view and the 32-bit view.
    const auto opened = [&] {
        std::string statuses;
        for (const std::string path : {kScratch, kScratch32}) {
            for (const AccessMask view : {AccessMask{0}, kKeyView64, kKeyView32}) {
                OwnedKey key(registry_);
                statuses += std::to_string(
                    registry_.openKey(KeyHandle::localMachine, path + "\\Only32", kKeyRead | view, key.receive()));
            }
        }
        return statuses;
    };
    const std::string path = std::string(kScratch) + "\\Only32";
    OwnedKey key(registry_);
    ASSERT_EQ(registry_.createKey(KeyHandle::localMachine, path, {}, kKeyFull | kKeyView32, key.receive()), kSuccess);
    EXPECT_EQ(opened(), "220000") << "a path into the 32-bit tree is used as it is";
    EXPECT_EQ(registry_.deleteKey(KeyHandle::localMachine, path, 0), kFileNotFound);
    EXPECT_EQ(registry_.deleteKey(KeyHandle::localMachine, path, kKeyView32), kSuccess);
    EXPECT_EQ(opened(), "222222");
}

}  // namespace
}  // namespace kz7::test
