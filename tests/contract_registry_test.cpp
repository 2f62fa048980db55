// What every registry must do alike: the one in memory and this machine's.
#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <sstream>
#include <vector>

#include "install/src/registry_access.h"
#include "tests/support/backends.h"

namespace kz7::test {
namespace {

class RegistryContract : public testing::TestWithParam<const char*> {
protected:
    RegistryContract() { enter(kScratch); }
    ~RegistryContract() override {
        key_.reset();
        deleteTree(registry_, KeyHandle::localMachine, kScratch, 0, {}, {});
        deleteTree(registry_, KeyHandle::localMachine, kScratch32, 0, {}, {});
    }

    // Makes a key of the machine the one that the helpers below work in.
    void enter(const std::string& path) {
        EXPECT_EQ(registry_.createKey(KeyHandle::localMachine, path, {}, kKeyFull, key_.receive()), kSuccess);
    }
    Status make(const std::string& path, const std::string& keyClass = {}) {
        OwnedKey key(registry_);
        return registry_.createKey(key_.get(), path, keyClass, kKeyFull, key.receive());
    }
    Status open(const std::string& path, AccessMask access = kKeyRead) {
        OwnedKey key(registry_);
        return registry_.openKey(key_.get(), path, access, key.receive());
    }
    Status remove(const std::string& path) { return registry_.deleteKey(key_.get(), path, 0); }
    Status set(const std::string& name, const std::string& data, ValueType type = ValueType::binary) {
        return registry_.setValue(key_.get(), name, type, data);
    }
    // Bytes of a value, or its status in brackets.
    std::string get(const std::string& name) {
        std::string room(200'000, '\0');
        Buffer data(room.data(), static_cast<std::uint32_t>(room.size()));
        const Status status = registry_.queryValue(key_.get(), name, nullptr, data);
        return status == kSuccess ? std::string(data.view()) : "<" + std::to_string(status) + ">";
    }
    // The index-th name of a key or value, or its status in brackets; or all of them.
    std::string keyAt(std::uint32_t index) { return nameOr(registry_.enumerateKey(key_.get(), index, name_, nullptr)); }
    std::string valueAt(std::uint32_t index) {
        return nameOr(registry_.enumerateValue(key_.get(), index, name_, nullptr, nullptr));
    }
    std::string nameOr(Status status) {
        return status == kSuccess ? std::string(name_.view()) : "<" + std::to_string(status) + ">";
    }
    std::string all(std::string (RegistryContract::*at)(std::uint32_t), bool sorted) {
        std::vector<std::string> names;
        for (std::string name = (this->*at)(0); name != "<259>";) {
            names.push_back(name);
            name = (this->*at)(static_cast<std::uint32_t>(names.size()));
        }
        if (sorted) {
            std::sort(names.begin(), names.end());
        }
        std::string text;
        for (const std::string& name : names) {
            text += (text.empty() ? "" : ",") + name;
        }
        return text;
    }
    std::string keys() { return all(&RegistryContract::keyAt, false); }
    std::string values() { return all(&RegistryContract::valueAt, differences_.ordersValuesByName); }
    std::string classBelow(const std::string& path) {
        OwnedKey key(registry_);
        FixedBuffer<16> keyClass;
        registry_.openKey(key_.get(), path, kKeyRead, key.receive());
        registry_.enumerateKey(key.get(), 0, name_, &keyClass);
        return '"' + std::string(keyClass.data) + '"';
    }

    // What the steps of a script answer, with blanks between them; "@" is the empty name.
    std::string answers(const std::string& script) {
        std::istringstream steps(script);
        std::string told;
        for (std::string step; std::getline(steps, step, ';');) {
            std::string verb;
            std::string name;
            std::string more;
            std::istringstream(step) >> verb >> name >> more;
            told += (told.empty() ? "" : " ") + answer(verb, name == "@" ? "" : name, more);
        }
        return told;
    }
    std::string answer(const std::string& verb, const std::string& name, const std::string& more) {
        if (verb == "key" || verb == "value") {
            const auto index = static_cast<std::uint32_t>(std::stoul(name));
            return verb == "key" ? keyAt(index) : valueAt(index);
        }
        if (verb == "keys" || verb == "values" || verb == "get" || verb == "class") {
            return verb == "keys" ? keys() : verb == "values" ? values() : verb == "get" ? get(name) : classBelow(name);
        }
        return std::to_string(verb == "make"     ? make(name, more)
                              : verb == "open"   ? open(name)
                              : verb == "remove" ? remove(name)
                              : verb == "set"    ? set(name, more)
                              : verb == "unset"  ? registry_.deleteValue(key_.get(), name)
                                                 : registry_.commit());
    }

    static constexpr auto kScratch = "SOFTWARE\\KZ7ContractTest";
    static constexpr auto kScratch32 = "SOFTWARE\\Wow6432Node\\KZ7ContractTest";
    std::unique_ptr<Backend> backend_ = backendNamed(GetParam());
    IRegistryStore& registry_ = backend_->platform().registry();
    Differences differences_ = backend_->differences();
    OwnedKey key_{registry_};
    FixedBuffer<kMaxValueName + 1> name_;
};

INSTANTIATE_TEST_SUITE_P(Stores, RegistryContract, testing::ValuesIn(kBackends));

TEST_P(RegistryContract, StepsAnswerAlike) {
    const bool passesOn = differences_.passesClassesOn;
    // clang-format off
    const struct { const char* why; const char* script; const char* answers; } rows[] = {
        {"names of keys compare without case, the first spelling stays",
         "make Alpha\\Beta; make aLPHA; open ALPHA\\bETA; keys; remove ALPHA\\BETA; open Alpha\\Beta", "0 0 0 Alpha 0 2"},
        {"and so do those of values",
         "set Name 1; set NAME 2; get nAme; values; set @ 3; get @; unset name; values; get Name", "0 0 2 Name 0 3 0  <2>"},
        {"other letters", "make \xC4; open \xE4; remove \xC4", differences_.foldsBeyondAscii ? "0 0 0" : "0 2 0"},
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
         differences_.ordersValuesByName ? "0 0 0 0 0 0 0 A,Z0,_x,b" : "0 0 0 0 0 0 0 b,_x,A,Z0"},
        {"parents are made, and a class stays with its key",
         "make One\\Two\\Three its; make One\\Two late; make One\\Two\\Three also; class @; class One; class One\\Two",
         passesOn ? "0 0 0 \"its\" \"late\" \"also\"" : "0 0 0 \"\" \"\" \"its\""},
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
    ASSERT_EQ(make("Gone"), kSuccess);
    ASSERT_EQ(make("There\\Below"), kSuccess);
    ASSERT_EQ(set("v", "x"), kSuccess);
    const auto opened = [&](const char* path, AccessMask access) {
        OwnedKey key(registry_);
        EXPECT_EQ(registry_.openKey(key_.get(), path, access, key.receive()), kSuccess) << path;
        return key;
    };
    OwnedKey gone = opened("Gone", kKeyFull);
    const OwnedKey query = opened("", kKeyQueryValue);
    const OwnedKey setting = opened("", kKeySetValue);
    const OwnedKey listing = opened("", kKeyEnumerateSubkeys);
    ASSERT_EQ(remove("Gone"), kSuccess);
    ASSERT_EQ(make("Gone"), kSuccess);

    OwnedKey below(registry_);
    FixedBuffer<16> room;
    // clang-format off
    const struct { const char* why; std::function<Status(KeyHandle)> operation; Status full, query, set, list; } rows[] = {
        {"open",   [&](KeyHandle key) { return registry_.openKey(key, "There", kKeyRead, below.receive()); },       0, 0, 0, 0},
        {"create", [&](KeyHandle key) { return registry_.createKey(key, "There", {}, kKeyRead, below.receive()); }, 0, 0, 0, 0},
        {"query a value",    [&](KeyHandle key) { return registry_.queryValue(key, "v", nullptr, room); },                 0, 0, 5, 5},
        {"set a value",      [&](KeyHandle key) { return registry_.setValue(key, "v", ValueType::binary, "y"); },          0, 5, 0, 5},
        {"delete a value",   [&](KeyHandle key) { return registry_.deleteValue(key, "absent"); },                          2, 5, 2, 5},
        {"enumerate keys",   [&](KeyHandle key) { return registry_.enumerateKey(key, 0, room, nullptr); },                 0, 5, 5, 0},
        {"enumerate values", [&](KeyHandle key) { return registry_.enumerateValue(key, 0, room, nullptr, nullptr); },      0, 0, 5, 5},
        {"delete a key",     [&](KeyHandle key) { return registry_.deleteKey(key, "Absent", 0); },                         2, 2, 2, 2},
    };
    // clang-format on
    OwnedKey closed = opened("", kKeyFull);
    const KeyHandle shut = closed.get();
    closed.reset();
    for (const auto& row : rows) {
        below.reset();  // a host may have given it the number of the key that was shut
        const Status expected[] = {kInvalidHandle, kInvalidHandle, kKeyDeleted, row.full, row.query, row.set, row.list};
        const KeyHandle handles[] = {shut,        KeyHandle::none, gone.get(),   key_.get(),
                                     query.get(), setting.get(),   listing.get()};
        for (std::size_t i = 0; i < std::size(handles); ++i) {
            EXPECT_EQ(row.operation(handles[i]), expected[i]) << row.why << i;
        }
    }
    below.reset();
    EXPECT_EQ(registry_.closeKey(shut), kInvalidHandle);
    EXPECT_EQ(registry_.closeKey(KeyHandle::none), kInvalidHandle);
    const KeyHandle deleted = gone.get();
    gone.leaveOpen();
    EXPECT_EQ(registry_.closeKey(deleted), kSuccess) << "a handle of a deleted key is still one to close";
    for (const KeyHandle root : {KeyHandle::localMachine, KeyHandle::currentUser, KeyHandle::users}) {
        EXPECT_EQ(registry_.closeKey(root), kSuccess);
        EXPECT_NE(registry_.enumerateKey(root, 0, room, nullptr), kInvalidHandle) << "a root stays open";
    }
}

TEST_P(RegistryContract, PathsAreReadAlike) {
    ASSERT_EQ(make("A\\B\\C"), kSuccess);
    const std::string longest(kMaxKeyName, 'k');
    // clang-format off
    const struct { const char* why; std::string path; Status status; } rows[] = {
        {"the key itself",            "",                           kSuccess},
        {"a path",                    "a\\b\\c",                    kSuccess},
        {"doubled separators",        "A\\\\B\\\\\\C",              kSuccess},
        {"a separator at the end",    "A\\B\\",                     kSuccess},
        {"a separator at the begin",  "\\A\\B",                     kBadPathname},
        {"nothing but a separator",   "\\",                         kBadPathname},
        {"a missing key",             "A\\X",                       kFileNotFound},
        {"the longest name, missing", longest,                      kFileNotFound},
        {"a name too long",           longest + "k",                kInvalidParameter},
        {"deep down, too long",       "A\\" + longest + "k" + "\\C", kInvalidParameter},
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
    EXPECT_EQ(keys(), "A") << "a refused path leaves nothing of itself";
    ASSERT_EQ(make(longest + "\\" + longest + "\\" + longest), kSuccess);
    EXPECT_EQ(open(longest + "\\" + longest + "\\" + longest), kSuccess);
    EXPECT_EQ(keys(), "A," + longest);
}

TEST_P(RegistryContract, ValuesKeepEveryByte) {
    std::string allBytes;
    for (int byte = 0; byte < 256; ++byte) {
        allBytes += static_cast<char>(byte);
    }
    // clang-format off
    const struct { const char* why; ValueType type; std::string data; } rows[] = {
        {"every byte",             ValueType::binary,          allBytes},
        {"nothing",                ValueType::binary,          ""},
        {"100,000 bytes",          ValueType::binary,          std::string(100'000, '\xFF')},
        {"a text of a path",       ValueType::expandSz,        std::string("%PATH%\\\xE9\0", 9)},
        {"a text without its end", ValueType::sz,              "text"},
        {"texts",                  ValueType::multiSz,         std::string("one\0two\0\0", 9)},
        {"a long number",          ValueType::qword,           std::string("\1\0\0\0\0\0\0\x80", 8)},
        {"an unknown type",        static_cast<ValueType>(77), "bytes"},
    };
    // clang-format on
    std::string room(200'000, '\0');
    for (const auto& row : rows) {
        ASSERT_EQ(set("v", row.data, row.type), kSuccess) << row.why;
        for (const bool listed : {false, true}) {
            Buffer data(room.data(), static_cast<std::uint32_t>(room.size()));
            ValueType type{};
            EXPECT_EQ(listed ? registry_.enumerateValue(key_.get(), 0, name_, &type, &data)
                             : registry_.queryValue(key_.get(), "v", &type, data),
                      kSuccess)
                << row.why;
            EXPECT_EQ(type, row.type) << row.why;
            EXPECT_EQ(data.view() == row.data, true) << row.why << ": " << data.size << " bytes";
        }
    }
}

TEST_P(RegistryContract, WhatDoesNotFitIsToldWithItsSize) {
    ASSERT_EQ(set("value", "12345"), kSuccess);
    ASSERT_EQ(make("subkey", "class"), kSuccess);
    // clang-format off
    const struct { const char* why; std::string_view whole; bool terminated; std::function<Status(Buffer&)> read; } rows[] = {
        {"a value's data",   "12345",  false, [&](Buffer& room) { return registry_.queryValue(key_.get(), "value", nullptr, room); }},
        {"listed data",      "12345",  false, [&](Buffer& room) { return registry_.enumerateValue(key_.get(), 0, name_, nullptr, &room); }},
        {"a value's name",   "value",  true,  [&](Buffer& room) { return registry_.enumerateValue(key_.get(), 0, room, nullptr, nullptr); }},
        {"a key's class",    "class",  true,  [&](Buffer& room) { return registry_.enumerateKey(key_.get(), 0, name_, &room); }},
        {"a key's name",     "subkey", true,  [&](Buffer& room) { return registry_.enumerateKey(key_.get(), 0, room, nullptr); }},
    };
    // clang-format on
    for (const auto& row : rows) {
        for (const std::uint32_t capacity : {0U, 1U, 4U, 5U, 6U, 7U, 16U}) {
            char bytes[16];
            Buffer room(bytes, capacity);
            const bool fits = capacity >= row.whole.size() + (row.terminated ? 1 : 0);
            EXPECT_EQ(row.read(room), fits ? kSuccess : kMoreData) << row.why << " in " << capacity;
            EXPECT_EQ(room.view(), fits ? row.whole : "") << row.why << " in " << capacity;
            if (!row.terminated) {
                EXPECT_EQ(room.size, row.whole.size()) << row.why << " in " << capacity;
            }
        }
    }
    FixedBuffer<4> small;
    ValueType type{};
    EXPECT_EQ(registry_.queryValue(key_.get(), "value", &type, small), kMoreData);
    EXPECT_EQ(type, ValueType::none);
    EXPECT_EQ(registry_.enumerateKey(key_.get(), 1, small, &small), kNoMoreItems);
    EXPECT_EQ(registry_.enumerateValue(key_.get(), 1, small, nullptr, &small), kNoMoreItems);
    EXPECT_EQ(registry_.queryValue(key_.get(), "absent", nullptr, small), kFileNotFound);
}

TEST_P(RegistryContract, NamesHoldAnythingButASeparatorAndANul) {
    for (const char* name : {"with blanks", " leading", "trailing ", "..", "100%d%s%%", "quote\"s'", "a/b",
                             "?*<>|:", "\xE9\xF1", "[x]=y;z", "tab\tfeed\n"}) {
        EXPECT_EQ(make(name), kSuccess) << name;
        EXPECT_EQ(keys(), name);
        EXPECT_EQ(remove(name), kSuccess) << name;
    }
    const std::string longest(kMaxValueName, 'v');
    for (const char* name :
         {" leading", "trailing ", "100%d%s%%", "\xE9\xF1", "tab\tfeed\n", "back\\slash", longest.c_str()}) {
        EXPECT_EQ(set(name, "x"), kSuccess) << name;
        EXPECT_EQ(get(name), "x") << name;
        EXPECT_EQ(values() == name, true) << name;
        EXPECT_EQ(registry_.deleteValue(key_.get(), name), kSuccess) << name;
    }
    for (const std::string& name : {std::string(kMaxValueName + 1, 'v'), std::string("a\0b", 3)}) {
        EXPECT_EQ(set(name, "x"), kInvalidParameter) << name.size();
        EXPECT_EQ(get(name), "<87>") << name.size();
        EXPECT_EQ(registry_.deleteValue(key_.get(), name), kInvalidParameter) << name.size();
    }
    EXPECT_EQ(values(), "");
}

TEST_P(RegistryContract, TheViewBitLeadsToTheOtherTree) {
    const auto on = [&](const char* path, AccessMask view) {
        OwnedKey key(registry_);
        return registry_.openKey(KeyHandle::localMachine, path, kKeyRead | view, key.receive());
    };
    OwnedKey key(registry_);
    const std::string path = std::string(kScratch) + "\\Only32";
    const std::string path32 = std::string(kScratch32) + "\\Only32";
    ASSERT_EQ(registry_.createKey(KeyHandle::localMachine, path, {}, kKeyFull | kKeyView32, key.receive()), kSuccess);
    EXPECT_EQ(on(path.c_str(), 0), kFileNotFound);
    EXPECT_EQ(on(path.c_str(), kKeyView64), kFileNotFound);
    EXPECT_EQ(on(path.c_str(), kKeyView32), kSuccess);
    EXPECT_EQ(on(path32.c_str(), 0), kSuccess);
    EXPECT_EQ(on(path32.c_str(), kKeyView32), kSuccess) << "a path that goes there already is left alone";
    EXPECT_EQ(registry_.deleteKey(KeyHandle::localMachine, path, 0), kFileNotFound);
    EXPECT_EQ(registry_.deleteKey(KeyHandle::localMachine, path, kKeyView32), kSuccess);
    EXPECT_EQ(on(path32.c_str(), 0), kFileNotFound);
}

}  // namespace
}  // namespace kz7::test
