// What every registry must do alike: the one in memory and this machine's.
#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <vector>

#include "install/src/registry_access.h"
#include "tests/support/backends.h"

namespace kz7::test {
namespace {

using Names = std::vector<std::string>;

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
    // The index-th name, or its status in brackets.
    std::string keyAt(std::uint32_t index) {
        const Status status = registry_.enumerateKey(key_.get(), index, name_, nullptr);
        return status == kSuccess ? std::string(name_.view()) : "<" + std::to_string(status) + ">";
    }
    std::string valueAt(std::uint32_t index) {
        const Status status = registry_.enumerateValue(key_.get(), index, name_, nullptr, nullptr);
        return status == kSuccess ? std::string(name_.view()) : "<" + std::to_string(status) + ">";
    }
    Names all(std::string (RegistryContract::*at)(std::uint32_t)) {
        Names found;
        while (found.empty() || found.back() != "<259>") {
            found.push_back((this->*at)(static_cast<std::uint32_t>(found.size())));
        }
        found.pop_back();
        return found;
    }
    Names keys() { return all(&RegistryContract::keyAt); }
    Names values() { return all(&RegistryContract::valueAt); }

    static constexpr auto kScratch = "SOFTWARE\\KZ7ContractTest";
    static constexpr auto kScratch32 = "SOFTWARE\\Wow6432Node\\KZ7ContractTest";
    std::unique_ptr<Backend> backend_ = backendNamed(GetParam());
    IRegistryStore& registry_ = backend_->platform().registry();
    Differences differences_ = backend_->differences();
    OwnedKey key_{registry_};
    FixedBuffer<kMaxValueName + 1> name_;
};

INSTANTIATE_TEST_SUITE_P(Stores, RegistryContract, testing::ValuesIn(kBackends));

TEST_P(RegistryContract, NamesCompareWithoutCaseAndKeepTheirFirstSpelling) {
    ASSERT_EQ(make("Alpha\\Beta", "c"), kSuccess);
    EXPECT_EQ(make("aLPHA"), kSuccess);
    EXPECT_EQ(open("ALPHA\\bETA"), kSuccess);
    EXPECT_EQ(keys(), Names{"Alpha"});
    ASSERT_EQ(set("Name", "first"), kSuccess);
    ASSERT_EQ(set("NAME", "second"), kSuccess);
    ASSERT_EQ(set("", "default"), kSuccess);
    EXPECT_EQ(get("nAme"), "second");
    EXPECT_EQ(get(""), "default");
    Names names = values();
    std::sort(names.begin(), names.end());
    EXPECT_EQ(names, (Names{"", "Name"}));
    EXPECT_EQ(registry_.deleteValue(key_.get(), "name"), kSuccess);
    EXPECT_EQ(values(), Names{""});
    EXPECT_EQ(remove("ALPHA\\BETA"), kSuccess);
    EXPECT_EQ(open("Alpha\\Beta"), kFileNotFound);

    ASSERT_EQ(make("\xC4\xD6"), kSuccess);
    EXPECT_EQ(open("\xE4\xF6"), differences_.foldsBeyondAscii ? kSuccess : kFileNotFound);
}

TEST_P(RegistryContract, SubkeysEnumerateByNameAndValuesByAge) {
    for (const char* name : {"b", "_x", "A", "z0", "Z1", "aa", "1", "a b", "~"}) {
        ASSERT_EQ(make(name), kSuccess) << name;
        ASSERT_EQ(set(name, "x"), kSuccess) << name;
    }
    const Names byUpperCase = {"1", "A", "a b", "aa", "b", "z0", "Z1", "_x", "~"};
    const Names byLowerCase = {"1", "_x", "A", "a b", "aa", "b", "z0", "Z1", "~"};
    EXPECT_EQ(keys(), differences_.ordersKeysByLowerCase ? byLowerCase : byUpperCase);

    ASSERT_EQ(set("A", "again"), kSuccess);
    ASSERT_EQ(registry_.deleteValue(key_.get(), "z0"), kSuccess);
    ASSERT_EQ(set("Z0", "anew"), kSuccess);
    const Names byAge = {"b", "_x", "A", "Z1", "aa", "1", "a b", "~", "Z0"};
    Names found = values();
    if (differences_.ordersValuesByName) {
        Names sorted = byAge;
        std::sort(sorted.begin(), sorted.end());
        std::sort(found.begin(), found.end());
        EXPECT_EQ(found, sorted);
    } else {
        EXPECT_EQ(found, byAge);
    }
}

TEST_P(RegistryContract, AnEnumerationSeesWhatChangesUnderIt) {
    enum Change { none, add, drop };
    // clang-format off
    const struct { Change change; const char* name; std::uint32_t index; const char* expected; const char* why; } rows[] = {
        {none, "",  0, "b",     "the first"},
        {drop, "b", 0, "c",     "after a delete the same index has the next"},
        {none, "",  1, "d",     "and on"},
        {add,  "e", 2, "e",     "one behind the place"},
        {add,  "f", 3, "f",     "one at the very end"},
        {none, "",  4, "<259>", "the end"},
        {none, "",  1, "d",     "back"},
        {drop, "c", 1, "e",     "one before the place"},
        {none, "",  2, "f",     "and on"},
        {none, "",  0, "d",     "back to the begin"},
        {drop, "f", 2, "<259>", "the last"},
        {none, "",  1, "e",     "back from the end"},
    };
    // clang-format on
    for (const char* name : {"b", "c", "d"}) {
        ASSERT_EQ(make(name), kSuccess);
        ASSERT_EQ(set(name, "x"), kSuccess);
    }
    for (const auto& row : rows) {
        if (row.change == add) {
            ASSERT_EQ(make(row.name), kSuccess);
            ASSERT_EQ(set(row.name, "x"), kSuccess);
        } else if (row.change == drop) {
            ASSERT_EQ(remove(row.name), kSuccess);
            ASSERT_EQ(registry_.deleteValue(key_.get(), row.name), kSuccess);
        }
        EXPECT_EQ(keyAt(row.index), row.expected) << row.why;
        EXPECT_EQ(valueAt(row.index), row.expected) << row.why;
    }
    // A name before the place moves what follows up by one.
    EXPECT_EQ(keyAt(1), "e");
    ASSERT_EQ(make("a"), kSuccess);
    EXPECT_EQ(keyAt(1), "d");
    EXPECT_EQ(keyAt(2), "e");
    // A mark in between loses neither handle nor place.
    ASSERT_EQ(registry_.commit(), kSuccess);
    EXPECT_EQ(keyAt(2), "e");
    EXPECT_EQ(keyAt(3), "<259>");
    EXPECT_EQ(valueAt(1), "e");
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
        EXPECT_EQ(row.operation(shut), kInvalidHandle) << row.why;
        EXPECT_EQ(row.operation(KeyHandle::none), kInvalidHandle) << row.why;
        EXPECT_EQ(row.operation(gone.get()), kKeyDeleted) << row.why;
        EXPECT_EQ(row.operation(key_.get()), row.full) << row.why;
        EXPECT_EQ(row.operation(query.get()), row.query) << row.why;
        EXPECT_EQ(row.operation(setting.get()), row.set) << row.why;
        EXPECT_EQ(row.operation(listing.get()), row.list) << row.why;
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
    const std::string tooLong(kMaxKeyName + 1, 'k');
    // clang-format off
    const struct { const char* why; std::string path; Status status; } rows[] = {
        {"the key itself",            "",                       kSuccess},
        {"a path",                    "a\\b\\c",                kSuccess},
        {"doubled separators",        "A\\\\B\\\\\\C",          kSuccess},
        {"a separator at the end",    "A\\B\\",                 kSuccess},
        {"a separator at the begin",  "\\A\\B",                 kBadPathname},
        {"nothing but a separator",   "\\",                     kBadPathname},
        {"a missing key",             "A\\X",                   kFileNotFound},
        {"the longest name, missing", longest,                  kFileNotFound},
        {"a name too long",           tooLong,                  kInvalidParameter},
        {"deep down, too long",       "A\\" + tooLong + "\\C",  kInvalidParameter},
        {"a NUL",                     std::string("A\0B", 3),   kInvalidParameter},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(open(row.path), row.status) << row.why;
        if (row.status != kFileNotFound) {
            EXPECT_EQ(make(row.path), row.status) << row.why;
        }
        if (row.status != kSuccess) {
            EXPECT_EQ(remove(row.path), row.status) << row.why;
        }
    }
    EXPECT_EQ(keys(), Names{"A"}) << "a refused path leaves nothing of itself";

    ASSERT_EQ(make(longest + "\\" + longest + "\\" + longest), kSuccess);
    EXPECT_EQ(open(longest + "\\" + longest + "\\" + longest), kSuccess);
    EXPECT_EQ(keys(), (Names{"A", longest}));
}

TEST_P(RegistryContract, ParentsAreMadeAndClassesStayWithTheirKey) {
    ASSERT_EQ(make("One\\Two\\Three", "its class"), kSuccess);
    ASSERT_EQ(make("One\\Two", "too late"), kSuccess);
    ASSERT_EQ(make("One\\Two\\Three", "also"), kSuccess);
    // clang-format off
    const struct { const char* path; std::string_view subkeysClass; std::string_view whenPassedOn; } rows[] = {
        {"",         "",          "its class"},
        {"One",      "",          "too late"},
        {"One\\Two", "its class", "also"},
    };
    // clang-format on
    FixedBuffer<16> name;
    FixedBuffer<10> keyClass;
    for (const auto& row : rows) {
        OwnedKey key(registry_);
        ASSERT_EQ(registry_.openKey(key_.get(), row.path, kKeyRead, key.receive()), kSuccess);
        EXPECT_EQ(registry_.enumerateKey(key.get(), 0, name, &keyClass), kSuccess) << row.path;
        EXPECT_EQ(keyClass.view(), differences_.passesClassesOn ? row.whenPassedOn : row.subkeysClass) << row.path;
        EXPECT_EQ(keyClass.data[keyClass.size], '\0') << row.path;
    }
}

TEST_P(RegistryContract, KeysWithSubkeysStay) {
    ASSERT_EQ(make("One\\Two"), kSuccess);
    OwnedKey one(registry_);
    ASSERT_EQ(registry_.openKey(key_.get(), "One", kKeyRead, one.receive()), kSuccess);
    EXPECT_EQ(remove("One"), kAccessDenied);
    EXPECT_EQ(open("One\\Two"), kSuccess);
    EXPECT_EQ(remove("One\\Absent"), kFileNotFound);
    EXPECT_EQ(remove("One\\Two"), kSuccess);
    EXPECT_EQ(remove("One\\Two"), kFileNotFound);
    EXPECT_EQ(registry_.deleteKey(one.get(), "", 0), kSuccess) << "the empty path is the key itself";
    EXPECT_EQ(open("One"), kFileNotFound);
    EXPECT_EQ(remove(""), kSuccess);
    EXPECT_EQ(keyAt(0), "<1018>");
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
        {"a text",                 ValueType::sz,              std::string("text\0", 5)},
        {"a text of a path",       ValueType::expandSz,        std::string("%PATH%\\\xE9\0", 9)},
        {"a text without its end", ValueType::sz,              "text"},
        {"texts",                  ValueType::multiSz,         std::string("one\0two\0\0", 9)},
        {"a number",               ValueType::dword,           std::string("\1\0\0\x80", 4)},
        {"a long number",          ValueType::qword,           std::string("\1\0\0\0\0\0\0\x80", 8)},
        {"an unknown type",        static_cast<ValueType>(77), "bytes"},
    };
    // clang-format on
    std::string room(200'000, '\0');
    for (const auto& row : rows) {
        ASSERT_EQ(set("v", row.data, row.type), kSuccess) << row.why;
        Buffer data(room.data(), static_cast<std::uint32_t>(room.size()));
        ValueType type{};
        EXPECT_EQ(registry_.queryValue(key_.get(), "v", &type, data), kSuccess) << row.why;
        EXPECT_EQ(type, row.type) << row.why;
        EXPECT_EQ(data.view() == row.data, true) << row.why << ": " << data.size << " bytes";
        Buffer listed(room.data(), static_cast<std::uint32_t>(room.size()));
        type = {};
        EXPECT_EQ(registry_.enumerateValue(key_.get(), 0, name_, &type, &listed), kSuccess) << row.why;
        EXPECT_EQ(type, row.type) << row.why;
        EXPECT_EQ(listed.view() == row.data, true) << row.why << ": " << listed.size << " bytes";
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
    for (const std::string name : {"with blanks", " leading", "trailing ", "dots.and..more", ".", "..", "100%d%s%%",
                                   "%PATH%", "quote\"s'", "a/b", "?*<>|:", "@", "\xE9\xF1", "[x]=y;z", "tab\tfeed\n"}) {
        EXPECT_EQ(make(name), kSuccess) << name;
        EXPECT_EQ(keys(), Names{name});
        EXPECT_EQ(remove(name), kSuccess) << name;
        EXPECT_EQ(set(name, name), kSuccess) << name;
        EXPECT_EQ(get(name), name);
        EXPECT_EQ(values(), Names{name});
        EXPECT_EQ(registry_.deleteValue(key_.get(), name), kSuccess) << name;
    }
    for (const std::string& name : {std::string("back\\slash"), std::string(kMaxValueName, 'v')}) {
        EXPECT_EQ(set(name, "x"), kSuccess) << name.size();
        EXPECT_EQ(get(name), "x") << name.size();
        EXPECT_EQ(values() == Names{name}, true) << name.size();
        EXPECT_EQ(registry_.deleteValue(key_.get(), name), kSuccess) << name.size();
    }
    for (const std::string& name : {std::string(kMaxValueName + 1, 'v'), std::string("a\0b", 3)}) {
        EXPECT_EQ(set(name, "x"), kInvalidParameter) << name.size();
        EXPECT_EQ(get(name), "<87>") << name.size();
        EXPECT_EQ(registry_.deleteValue(key_.get(), name), kInvalidParameter) << name.size();
    }
    EXPECT_EQ(values(), Names{});
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
