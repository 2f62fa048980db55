// What every registry must do alike: the one in memory and this machine's.
#include <gtest/gtest.h>

#include <functional>
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

    // Makes a key of the machine the one that the helpers below work in.
    void enter(const std::string& path) {
        EXPECT_EQ(registry_.createKey(KeyHandle::localMachine, path, {}, kKeyFull, key_.receive()), kSuccess);
        at_ = key_.get();
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

    // What was asked for, or the status in brackets: a value's bytes, the index-th name of a key, with its class, or of
    // a value; or all of them.
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
               : keyClass.size != 0 ? std::string(name_.view()) + "=" + keyClass.data
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

    // What the steps of a script answer, with blanks between them; "@" is the empty name.
    std::string answers(const std::string& script) {
        std::istringstream steps(script);
        std::string told;
        for (std::string step; std::getline(steps, step, ';');) {
            std::string words[3];
            std::istringstream(step) >> words[0] >> words[1] >> words[2];
            told += (told.empty() ? "" : " ") + answer(words[0], words[1] == "@" ? "" : words[1], words[2]);
        }
        return told;
    }
    std::string answer(const std::string& verb, const std::string& name, const std::string& more) {
        if (verb == "keys" || verb == "values") {
            return names(verb == "keys");
        }
        if (verb == "key" || verb == "value") {
            return nameAt(verb == "key", std::stoul(name));
        }
        return verb == "get" ? get(name)
                             : std::to_string(verb == "make"     ? make(name, more)
                                              : verb == "open"   ? open(name)
                                              : verb == "remove" ? remove(name)
                                              : verb == "set"    ? set(name, more)
                                              : verb == "unset"  ? unset(name)
                                                                 : registry_.commit());
    }

    static constexpr auto kScratch = "SOFTWARE\\KZ7ContractTest";
    static constexpr auto kScratch32 = "SOFTWARE\\Wow6432Node\\KZ7ContractTest";
    IRegistryStore& registry_ = platform_.registry();
    Differences differences_ = backend_->differences();
    OwnedKey key_{registry_};
    KeyHandle at_ = KeyHandle::none;  // what the helpers work in: that key, unless a test says otherwise
    FixedBuffer<kMaxValueName + 1> name_;
    FixedBuffer<200'000> room_;
};

INSTANTIATE_TEST_SUITE_P(Stores, RegistryContract, testing::ValuesIn(kBackends));

TEST_P(RegistryContract, StepsAnswerAlike) {
    // clang-format off
    const struct { const char* why; const char* script; const char* answers; } rows[] = {
        {"names of keys compare without case, the first spelling stays",
         "make Alpha\\Beta; make aLPHA; open ALPHA\\bETA; keys; remove ALPHA\\BETA; open Alpha\\Beta", "0 0 0 Alpha 0 2"},
        {"and so do those of values",
         "set Name 1; set NAME 2; get nAme; values; set @ 3; get @; unset name; values; get Name", "0 0 2 Name 0 3 0  <2>"},
        {"other letters", "make \xC3\x84; open \xC3\xA4; remove \xC3\x84", differences_.foldsBeyondAscii ? "0 0 0" : "0 2 0"},
        {"an enumeration of keys sees what is done before, at and behind its place, and a mark loses none",
         "make b; make c; make d; key 0; remove b; key 0; key 1; make e; key 2; make f; key 3; key 4; key 1; remove c; key 1;"
         "key 2; key 0; remove f; key 2; key 1; make a; key 1; key 2; commit; key 2; key 3",
         "0 0 0 b 0 c d 0 e 0 f <259> d 0 e f d 0 <259> e 0 d e 0 e <259>"},
        {"and so does one of values",
         "set b; set c; set d; value 0; unset b; value 0; value 1; set e; value 2; set f; value 3; value 4; value 1; unset c;"
         "value 1; value 2; value 0; unset f; value 2; value 1; commit; value 1",
         "0 0 0 b 0 c d 0 e 0 f <259> d 0 e f d 0 <259> e 0 e"},
        {"subkeys enumerate by name",
         "make b; make _x; make A; make z0; make Z1; make aa; make 1; make ~; keys",
         differences_.ordersKeysByLowerCase ? "0 0 0 0 0 0 0 0 1,_x,A,aa,b,z0,Z1,~" : "0 0 0 0 0 0 0 0 1,A,aa,b,z0,Z1,_x,~"},
        {"values by age", "set b; set _x; set A; set z0; set a again; unset Z0; set Z0; values",
         differences_.ordersValuesByName ? "0 0 0 0 0 0 0 _x,A,b,Z0" : "0 0 0 0 0 0 0 b,_x,A,Z0"},
        {"a class stays with its key", "make One its; make One late; keys",
         differences_.passesClassesOn ? "0 0 One=late" : "0 0 One=its"},
        {"parents that are made have none", "make Two\\Three its; keys",
         differences_.passesClassesOn ? "0 Two=its" : "0 Two"},
        {"keys with subkeys stay, the empty path is the key itself",
         "make One\\Two; remove One; open One\\Two; remove One\\Absent; remove One\\Two; remove One\\Two; remove One;"
         "open One; remove @; key 0", "0 5 0 2 0 2 0 2 0 <1018>"},
    };
    // clang-format on
    for (const auto& row : rows) {
        enter(std::string(kScratch) + "\\" + std::to_string(&row - rows));
        EXPECT_EQ(answers(row.script), row.answers) << row.why;
    }
}

TEST_P(RegistryContract, OperationsAnswerByTheStateOfTheirHandle) {
    ASSERT_EQ(answers("make Gone; make There\\Below; set v x"), "0 0 0");
    const auto opened = [&](const char* path, AccessMask access) {
        OwnedKey key(registry_);
        EXPECT_EQ(registry_.openKey(at_, path, access, key.receive()), kSuccess) << path;
        return key;
    };
    OwnedKey gone = opened("Gone", kKeyFull);
    const OwnedKey query = opened("", kKeyQueryValue);
    const OwnedKey setting = opened("", kKeySetValue);
    const OwnedKey listing = opened("", kKeyEnumerateSubkeys);
    ASSERT_EQ(answers("remove Gone; make Gone"), "0 0") << "another key of that name";
    const KeyHandle shut = opened("", kKeyFull).get();
    // clang-format off
    const struct { const char* why; KeyHandle key; const char* answers; } rows[] = {
        {"one that was closed",  shut,             "6 6 <6> 6 6 <6> <6> 6"},
        {"none",                 KeyHandle::none,  "6 6 <6> 6 6 <6> <6> 6"},
        {"of a deleted key",     gone.get(),       "1018 1018 <1018> 1018 1018 <1018> <1018> 1018"},
        {"with every right",     at_,              "0 0 x 0 2 Gone v 2"},
        {"to query values only", query.get(),      "0 0 y 5 5 <5> v 2"},
        {"to set values only",   setting.get(),    "0 0 <5> 0 2 <5> <5> 2"},
        {"to list keys only",    listing.get(),    "0 0 <5> 5 5 Gone <5> 2"},
    };
    // clang-format on
    for (const auto& row : rows) {
        at_ = row.key;
        EXPECT_EQ(answers("open There; make There; get v; set v y; unset absent; key 0; value 0; remove Absent"),
                  row.answers)
            << row.why;
    }
    EXPECT_EQ(registry_.closeKey(shut), kInvalidHandle);
    EXPECT_EQ(registry_.closeKey(KeyHandle::none), kInvalidHandle);
    const KeyHandle deleted = gone.get();
    gone.leaveOpen();
    EXPECT_EQ(registry_.closeKey(deleted), kSuccess) << "a handle of a deleted key is still one to close";
    for (const KeyHandle root : {KeyHandle::localMachine, KeyHandle::currentUser, KeyHandle::users}) {
        EXPECT_EQ(registry_.closeKey(root), kSuccess);
        at_ = root;
        EXPECT_NE(answers("key 0"), "<6>") << "a root stays open";
    }
}

// A character of three bytes in UTF-8, one unit in UTF-16, so many times.
std::string repeated(std::size_t times) {
    std::string text;
    while (times-- > 0) {
        text += "\xE8\xA1\xA8";
    }
    return text;
}

TEST_P(RegistryContract, PathsAreReadAlike) {
    ASSERT_EQ(make("A\\B\\C"), kSuccess);
    const std::string longest(kMaxKeyName, 'k');
    // clang-format off
    const struct { const char* why; std::string path; Status status; } rows[] = {
        {"doubled separators",        "A\\\\b\\\\\\C",              kSuccess},
        {"a separator at the end",    "A\\B\\",                     kSuccess},
        {"a separator at the begin",  "\\A\\B",                     kBadPathname},
        {"nothing but a separator",   "\\",                         kBadPathname},
        {"the longest name, missing", longest,                      kFileNotFound},
        {"a name too long",           longest + "k",                kInvalidParameter},
        {"deep down, too long",       "A\\" + longest + "k" + "\\C", kInvalidParameter},
        {"255 of three bytes",        repeated(255),              kFileNotFound},
        {"256 of three bytes",        repeated(256),              kInvalidParameter},
        {"a NUL",                     std::string("A\0B", 3),       kInvalidParameter},
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
    EXPECT_EQ(names(true), "A," + longest) << "a refused path leaves nothing of itself";
}

TEST_P(RegistryContract, ValuesKeepEveryByte) {
    std::string allBytes(256, '\0');
    std::iota(allBytes.begin(), allBytes.end(), '\0');
    // clang-format off
    const struct { const char* why; ValueType type; std::string data; } rows[] = {
        {"every byte",             ValueType::binary,          allBytes},
        {"nothing",                ValueType::binary,          ""},
        {"100,000 bytes",          ValueType::binary,          std::string(100'000, '\xFF')},
        {"a text of a path",       ValueType::expandSz,        std::string("%PATH%\\\xC3\xA9\0", 10)},
        {"a text without its end", ValueType::sz,              "text"},
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

TEST_P(RegistryContract, WhatDoesNotFitIsToldWithItsSize) {
    ASSERT_EQ(answers("set value 12345; make subkey class"), "0 0");
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

TEST_P(RegistryContract, NamesHoldAnythingButASeparatorAndANul) {
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

TEST_P(RegistryContract, TheViewBitLeadsToTheOtherTree) {
    // Through the path and the one of the other tree, each without a view, in the wide and in the narrow one.
    const auto opened = [&] {
        std::string told;
        for (const std::string path : {kScratch, kScratch32}) {
            for (const AccessMask view : {AccessMask{0}, kKeyView64, kKeyView32}) {
                OwnedKey key(registry_);
                told += std::to_string(
                    registry_.openKey(KeyHandle::localMachine, path + "\\Only32", kKeyRead | view, key.receive()));
            }
        }
        return told;
    };
    const std::string path = std::string(kScratch) + "\\Only32";
    OwnedKey key(registry_);
    ASSERT_EQ(registry_.createKey(KeyHandle::localMachine, path, {}, kKeyFull | kKeyView32, key.receive()), kSuccess);
    EXPECT_EQ(opened(), "220000") << "a path that goes there already is left alone";
    EXPECT_EQ(registry_.deleteKey(KeyHandle::localMachine, path, 0), kFileNotFound);
    EXPECT_EQ(registry_.deleteKey(KeyHandle::localMachine, path, kKeyView32), kSuccess);
    EXPECT_EQ(opened(), "222222");
}

}  // namespace
}  // namespace kz7::test
