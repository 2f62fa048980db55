// What every registry must do alike: the one in memory and this machine's.
#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "tests/support/backends.h"

namespace kz7::test {
namespace {

using Names = std::vector<std::string>;

class RegistryContract : public testing::TestWithParam<const char*> {
protected:
    RegistryContract() { enter(kScratch); }
    ~RegistryContract() override {
        key_.reset();
        deleteTree(kScratch);
        deleteTree(kScratch32);
    }

    void deleteTree(const std::string& path) {
        FixedBuffer<kMaxKeyName + 1> name;
        OwnedKey key(registry_);
        if (registry_.openKey(KeyHandle::localMachine, path, kKeyRead, key.receive()) == kSuccess) {
            while (registry_.enumerateKey(key.get(), 0, name, nullptr) == kSuccess) {
                deleteTree(path + '\\' + std::string(name.view()));
            }
        }
        registry_.deleteKey(KeyHandle::localMachine, path, 0);
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
    Names keys() {
        Names all;
        while (all.empty() || all.back() != "<259>") {
            all.push_back(keyAt(static_cast<std::uint32_t>(all.size())));
        }
        all.pop_back();
        return all;
    }
    Names values() {
        Names all;
        while (all.empty() || all.back() != "<259>") {
            all.push_back(valueAt(static_cast<std::uint32_t>(all.size())));
        }
        all.pop_back();
        return all;
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

TEST_P(RegistryContract, ACrowdIsSeenWholeAndEmptiedFromTheFront) {
    constexpr int kMany = 3000;
    for (int i = 0; i < kMany; ++i) {
        const std::string name = std::to_string(100'000 + i);
        ASSERT_EQ(make("Crowd\\" + name), kSuccess);
        ASSERT_EQ(set(name, name), kSuccess);
    }
    enter(std::string(kScratch) + "\\Crowd");
    for (int i = 0; i < kMany; ++i) {
        const std::string name = std::to_string(100'000 + i);
        ASSERT_EQ(keyAt(static_cast<std::uint32_t>(i)), name);
    }
    for (int i = 0; i < kMany; ++i) {
        const std::string name = std::to_string(100'000 + i);
        ASSERT_EQ(keyAt(0), name);
        ASSERT_EQ(remove(name), kSuccess);
    }
    EXPECT_EQ(keyAt(0), "<259>");
    enter(kScratch);
    EXPECT_EQ(values().size(), std::size_t{kMany});
    for (int i = 0; i < kMany; ++i) {
        ASSERT_EQ(registry_.deleteValue(key_.get(), valueAt(0)), kSuccess);
    }
    EXPECT_EQ(valueAt(0), "<259>");
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

    using Operation = Status (*)(IRegistryStore&, KeyHandle);
    const Operation openIt = [](IRegistryStore& registry, KeyHandle key) {
        OwnedKey below(registry);
        return registry.openKey(key, "There", kKeyRead, below.receive());
    };
    const Operation createIt = [](IRegistryStore& registry, KeyHandle key) {
        OwnedKey below(registry);
        return registry.createKey(key, "There", {}, kKeyRead, below.receive());
    };
    const Operation queryIt = [](IRegistryStore& registry, KeyHandle key) {
        FixedBuffer<8> data;
        return registry.queryValue(key, "v", nullptr, data);
    };
    const Operation setIt = [](IRegistryStore& registry, KeyHandle key) {
        return registry.setValue(key, "v", ValueType::binary, "y");
    };
    const Operation deleteValueIt = [](IRegistryStore& registry, KeyHandle key) {
        return registry.deleteValue(key, "absent");
    };
    const Operation listKeys = [](IRegistryStore& registry, KeyHandle key) {
        FixedBuffer<16> name;
        return registry.enumerateKey(key, 0, name, nullptr);
    };
    const Operation listValues = [](IRegistryStore& registry, KeyHandle key) {
        FixedBuffer<16> name;
        return registry.enumerateValue(key, 0, name, nullptr, nullptr);
    };
    const Operation deleteIt = [](IRegistryStore& registry, KeyHandle key) {
        return registry.deleteKey(key, "Absent", 0);
    };
    // clang-format off
    const struct { const char* why; Operation operation; Status full; Status query; Status set; Status list; } rows[] = {
        {"open",             openIt,        0, 0, 0, 0},
        {"create",           createIt,      0, 0, 0, 0},
        {"query a value",    queryIt,       0, 0, 5, 5},
        {"set a value",      setIt,         0, 5, 0, 5},
        {"delete a value",   deleteValueIt, 2, 5, 2, 5},
        {"enumerate keys",   listKeys,      0, 5, 5, 0},
        {"enumerate values", listValues,    0, 0, 5, 5},
        {"delete a key",     deleteIt,      2, 2, 2, 2},
    };
    // clang-format on
    OwnedKey closed = opened("", kKeyFull);
    const KeyHandle shut = closed.get();
    closed.reset();
    for (const auto& row : rows) {
        EXPECT_EQ(row.operation(registry_, shut), kInvalidHandle) << row.why;
        EXPECT_EQ(row.operation(registry_, KeyHandle::none), kInvalidHandle) << row.why;
        EXPECT_EQ(row.operation(registry_, gone.get()), kKeyDeleted) << row.why;
        EXPECT_EQ(row.operation(registry_, key_.get()), row.full) << row.why;
        EXPECT_EQ(row.operation(registry_, query.get()), row.query) << row.why;
        EXPECT_EQ(row.operation(registry_, setting.get()), row.set) << row.why;
        EXPECT_EQ(row.operation(registry_, listing.get()), row.list) << row.why;
    }
    EXPECT_EQ(registry_.closeKey(shut), kInvalidHandle);
    EXPECT_EQ(registry_.closeKey(KeyHandle::none), kInvalidHandle);
    const KeyHandle deleted = gone.get();
    gone.leaveOpen();
    EXPECT_EQ(registry_.closeKey(deleted), kSuccess) << "a handle of a deleted key is still one to close";
    for (const KeyHandle root : {KeyHandle::localMachine, KeyHandle::currentUser, KeyHandle::users}) {
        EXPECT_EQ(registry_.closeKey(root), kSuccess);
        EXPECT_EQ(listKeys(registry_, root) == kInvalidHandle, false) << "a root stays open";
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
        {"a missing parent",          "X\\B",                   kFileNotFound},
        {"the longest name, missing", longest,                  kFileNotFound},
        {"a name too long",           tooLong,                  kInvalidParameter},
        {"deep down, too long",       "A\\" + tooLong + "\\C",  kInvalidParameter},
        {"a NUL",                     std::string("A\0B", 3),   kInvalidParameter},
        {"another separator",         "A/B",                    kFileNotFound},
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
        {"no text",                ValueType::sz,              ""},
        {"10,000 bytes",           ValueType::binary,          std::string(10'000, 'b')},
        {"100,000 bytes",          ValueType::binary,          std::string(100'000, '\xFF')},
        {"a text",                 ValueType::sz,              std::string("text\0", 5)},
        {"a text of a path",       ValueType::expandSz,        std::string("%PATH%\\\xE9\0", 9)},
        {"a text without its end", ValueType::sz,              "text"},
        {"texts",                  ValueType::multiSz,         std::string("one\0two\0\0", 9)},
        {"a number",               ValueType::dword,           std::string("\1\0\0\x80", 4)},
        {"a long number",          ValueType::qword,           std::string("\1\0\0\0\0\0\0\x80", 8)},
        {"bytes of no type",       ValueType::none,            allBytes},
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
    char room[16];
    for (const std::uint32_t capacity : {0U, 1U, 4U, 5U, 6U, 16U}) {
        ValueType type{};
        Buffer data(room, capacity);
        const Status expected = capacity < 5 ? kMoreData : kSuccess;
        EXPECT_EQ(registry_.queryValue(key_.get(), "value", &type, data), expected) << capacity;
        EXPECT_EQ(data.size, 5U) << capacity;
        EXPECT_EQ(type, capacity < 5 ? ValueType::none : ValueType::binary) << capacity;
        EXPECT_EQ(data.view(), capacity < 5 ? "" : "12345") << capacity;

        Buffer listed(room, capacity);
        EXPECT_EQ(registry_.enumerateValue(key_.get(), 0, name_, nullptr, &listed), expected) << capacity;
        EXPECT_EQ(listed.size, 5U) << capacity;

        Buffer valueName(room, capacity);
        EXPECT_EQ(registry_.enumerateValue(key_.get(), 0, valueName, nullptr, nullptr),
                  capacity < 6 ? kMoreData : kSuccess)
            << capacity << ": the NUL must fit too";
        EXPECT_EQ(valueName.view(), capacity < 6 ? "" : "value") << capacity;

        Buffer keyClass(room, capacity);
        EXPECT_EQ(registry_.enumerateKey(key_.get(), 0, name_, &keyClass), capacity < 6 ? kMoreData : kSuccess)
            << capacity;
        EXPECT_EQ(keyClass.view(), capacity < 6 ? "" : "class") << capacity;

        Buffer keyName(room, capacity);
        EXPECT_EQ(registry_.enumerateKey(key_.get(), 0, keyName, nullptr), capacity < 7 ? kMoreData : kSuccess)
            << capacity;
        EXPECT_EQ(keyName.view(), capacity < 7 ? "" : "subkey") << capacity;
    }
    FixedBuffer<4> small;
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
