// Registry-editor text: an export is read back exactly, and a bad line is reported before anything is changed.
#include <gtest/gtest.h>

#include <algorithm>
#include <sstream>

#include "install/admin/formats/reg_text.h"
#include "install/platform/encoding.h"
#include "install/platform/memory/registry.h"
#include "tests/support/fault_sweep.h"
#include "tests/support/reg_text_store.h"
#include "tests/support/registry_dump.h"

namespace kz7 {
namespace {

using namespace std::literals;
using test::exportAll;
using test::importText;

constexpr std::string_view kHead = "Windows Registry Editor Version 5.00\n";

std::string headed(std::string_view lines) {
    return std::string(kHead) + std::string(lines);
}

void set(IRegistryStore& registry, std::string_view path, std::string_view name, ValueType type, std::string_view data,
         std::string_view keyClass = {}, KeyHandle root = KeyHandle::localMachine) {
    OwnedKey key(registry);
    ASSERT_EQ(registry.createKey(root, path, keyClass, kKeyFull, key.receive()), kSuccess);
    ASSERT_EQ(registry.setValue(key.get(), name, type, data), kSuccess);
}

// Both roots, in an order that does not depend on when a value was set.
std::vector<std::string> contents(IRegistryStore& registry) {
    std::istringstream dump(test::dumpRegistry(registry) + test::dumpRegistry(registry, KeyHandle::users));
    std::vector<std::string> lines;
    for (std::string line; std::getline(dump, line);) {
        lines.push_back(line);
    }
    std::sort(lines.begin(), lines.end());
    return lines;
}

// The embedded store accepts any bytes as text; on Windows texts are UTF-16.
const bool kBytesAreText = textFromUtf16(u"\xDCE9").size() == 1;

std::string asText(const std::string& bytes) {
    return kBytesAreText ? bytes : textFromUtf16(utf16FromText(bytes));
}

TEST(RegText, RoundTripIsExactInEveryByte) {
    std::string bytes;
    for (int byte = 0; byte < 256; ++byte) {
        bytes += static_cast<char>(byte);
    }
    // clang-format off
    const std::vector<std::string> datas = {
        "", "\0"s, "\0\0"s, "one\0"s, "no end", "two\0ends\0"s, "a\0\0"s, "odd", "12345678", bytes, bytes + bytes,
        "line\nend\0"s, "line\rend\0"s, "tab\tand \x7f\0"s, "\"quoted\\\0"s, "ends in \\\0"s, "; [x] ,=\0"s,
        "\xC3\xA9 \xF0\x9F\x98\x80\0"s, "no UTF-8: \xE9 \xC3\0"s, "a surrogate: \xED\xB2\x80 \xED\xA0\x80\0"s,
        "too long: \xC0\x80 \xF4\x90\x80\x80\0"s, "C1: \xC2\x85\0"s, "\xEF\xBB\xBF\0"s, std::string(2000, 'x') + '\0',
    };
    // clang-format on
    MemoryRegistry registry;
    int number = 0;
    for (const std::uint32_t type : {0U, 1U, 2U, 3U, 4U, 7U, 11U, 0x1234ABCDU, 0xFFFFFFFFU}) {
        for (const std::string& data : datas) {
            const auto each = static_cast<ValueType>(type);
            set(registry, "values", std::to_string(number++), each, isTextType(each) ? asText(data) : data);
        }
    }
    for (const std::string& name : {""s, bytes.substr(1), "\x80"s, "\xED\xB0\x81 \xED\xB0\x80"s,
                                    "\xED\xA0\x80\xED\xA0\x81\xED\xB0\x80"s, std::string(kMaxValueName, '"')}) {
        set(registry, "names", asText(name), ValueType::sz, "data\0"sv);
    }
    set(registry, std::string(kMaxKeyName, ']') + "\\[-HKLM]\\;class=\"x\"\\ blanks ", "n", ValueType::sz, "\0"sv);
    std::string deep = "k";
    for (int level = 1; level < 500; ++level) {
        deep += "\\k";
    }
    set(registry, deep, "at the bottom", ValueType::sz, "\0"sv);
    set(registry, "classes\\plain", "n", ValueType::none, {}, asText("Some \"class\"\n\\ \xE9"));
    set(registry, "S-1-5-18\\Software", {}, ValueType::binary, "\xFF"sv, {}, KeyHandle::users);
    set(registry, {}, "in a root", ValueType::none, {}, {}, KeyHandle::users);

    const std::string text = exportAll(registry);
    EXPECT_TRUE(std::none_of(text.begin(), text.end(), [](char c) {
        return (c >= 0 && c < ' ' && c != '\n') || c == 0x7F;
    })) << "no control character reaches a terminal";
    // The fuzzer's inputs try the other encodings.
    MemoryRegistry again;
    EXPECT_EQ(importText(again, text), "");
    EXPECT_EQ(contents(again), contents(registry));
    EXPECT_EQ(importText(again, headed("[-HKLM\\k]\n")), "");
    EXPECT_TRUE(exportAll(again).find("at the bottom") == std::string::npos);
}

TEST(RegText, WritesWhatOtherEditorsRead) {
    // clang-format off
    const struct { ValueType type; std::string data; const char* line; const char* why; } rows[] = {
        {ValueType::sz,       "C:\\a \"b\"\0"s,     R"("C:\\a \"b\"")",                     "a text of one line"},
        {ValueType::sz,       ""s,                  "hex(1):",                              "a text without a byte"},
        {ValueType::sz,       "ab"s,                "hex(1):61,00,62,00",                   "a text without its end"},
        {ValueType::sz,       "a\n\0"s,             "hex(1):61,00,0a,00,00,00",             "a line end"},
        {ValueType::multiSz,  "a\0\0"s,             "hex(7):61,00,00,00,00,00",             "several texts"},
        {ValueType::dword,    "\x2A\0\0\xFE"s,      "dword:fe00002a",                       "a number"},
        {ValueType::dword,    "\x2A\0"s,            "hex(4):2a,00",                         "a number cut short"},
        {ValueType::binary,   "\0\xFF"s,            "hex:00,ff",                            "bytes"},
        {ValueType::none,     ""s,                  "hex(0):",                              "no type"},
        {ValueType::qword,    "12345678"s,          "hex(b):31,32,33,34,35,36,37,38",       "a long number"},
        {ValueType::binary,   std::string(25, 'A'), "hex:41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,41,\\\n  41", "two lines"},
        {ValueType::sz,       "\xC3\xA9\0"s,        "\"\xC3\xA9\"",                         "another letter"},
        {ValueType::sz,       "\xE9\0"s,            "hex(1):e9,dc,00,00",                   "a byte that is no UTF-8"},
        {ValueType::expandSz, "\xF0\x9F\x98\x80"s,  "hex(2):3d,d8,00,de",                   "beyond 16 bits"},
        {ValueType::sz,       "\xED\xA0\x80\0"s,    "hex(1):00,d8,00,00",                   "an unpaired surrogate"},
    };
    // clang-format on
    for (const auto& row : rows) {
        MemoryRegistry registry;
        set(registry, "k", "n", row.type, row.data, "c");
        EXPECT_EQ(exportAll(registry), headed("\n[HKEY_LOCAL_MACHINE\\k]\n;class=\"c\"\n\"n\"=") + row.line + "\n")
            << row.why;
    }
    EXPECT_EQ(utf16FileText("a\xED\xB2\x80\n"), "a\0\x80\xDC\r\0\n\0"s);
    MemoryRegistry old;
    EXPECT_EQ(importText(old, "REGEDIT4\r\n\r\n[HKEY_USERS\\a]\r\n\"b\"=\"\xE9\"\r\n\"t\"=hex(2):41,00\r\n"), "");
    EXPECT_EQ(contents(old),
              (std::vector<std::string>{"[a] ", kBytesAreText ? "a : b = 1:\\xe9\\x00" : "a : b = 1:\\xc3\\xa9\\x00",
                                        "a : t = 2:A\\x00"}));
}

TEST(RegText, ReadsAnySpellingOrReportsTheBadLine) {
    // clang-format off
    const struct { std::string lines; const char* left; const char* why; } rows[] = {
        {"[HKLM\\a]\n[hkey_users\\b]\n[HKU\\c]", "\n[HKEY_LOCAL_MACHINE\\a]\n\n[HKEY_USERS\\b]\n\n[HKEY_USERS\\c]\n",
         "short and long roots in any case, no line end at the end"},
        {"  [HKU\\a] \t\n ; comment\n\n  \"n\" = \"x\" ; comment\n@=dword:A\n", "\n[HKEY_USERS\\a]\n@=dword:0000000a\n\"n\"=\"x\"\n",
         "blanks and comments"},
        {"[HKU\\a]\n\"n\"=hex: 1, 2 ,\\ ; comment\r\n\t3,\\\n  FF\n", "\n[HKEY_USERS\\a]\n\"n\"=hex:01,02,03,ff\n",
         "lists over several lines"},
        {"[HKU\\a\\b\\c]\n[HKU\\a\\d]\n[-HKU\\a\\b]\n[-HKU\\none\\of\\it]\n", "\n[HKEY_USERS\\a]\n\n[HKEY_USERS\\a\\d]\n",
         "a tree is deleted, one that is not there too"},
        {"[HKU\\a]\n\"x\"=\"1\"\n\"y\"=\"2\"\n\"X\"=-\n\"z\"=-\n@=-\n", "\n[HKEY_USERS\\a]\n\"y\"=\"2\"\n",
         "values are deleted, those that are not there too"},
        {"[-HKU\\a]\n[HKU\\a]\n;class=\"c\"\n[HKU\\b]\n\"x\"=\"\"\n;class=\"no\"\n",
         "\n[HKEY_USERS\\a]\n;class=\"c\"\n\n[HKEY_USERS\\b]\n\"x\"=\"\"\n", "a class only behind its key"},
        {"[HKU\\_]\n[HKU\\b]\n[HKU\\C]\n[HKU\\a]\n\"_\"=hex:\n\"C\"=hex:\n\"b\"=hex:\n@=hex:\n",
         "\n[HKEY_USERS\\a]\n@=hex:\n\"b\"=hex:\n\"C\"=hex:\n\"_\"=hex:\n\n[HKEY_USERS\\b]\n\n[HKEY_USERS\\C]\n\n[HKEY_USERS\\_]\n", "it is sorted"},
        {"[HKU\\a]\n\"x\"=hex(1):41,00,42\n\"y\"=hex(7):41\n", "\n[HKEY_USERS\\a]\n\"x\"=hex(1):41,00,42\n\"y\"=hex(7):41\n",
         "texts that end within a unit"},
        {"[HKU\\a]\n;class of my own\n", "\n[HKEY_USERS\\a]\n", "a comment that only looks like a class"},
    };
    const std::string key = headed("[HKLM\\a]\n");
    const struct { std::string file; const char* fault; } bad[] = {
        {"",                                              "1: the file does not begin with \"Windows Registry Editor Version 5.00\""},
        {"\xFF\xFEW"s,                                    "1: the file ends within a character"},
        {key + "\"x\"=\"\xE9\"\n",                        "3: this is no UTF-8"},
        {key + "\n;\0\n"s,                                "4: there is a NUL character"},
        {headed("\"x\"=\"y\"\n"),                         "2: the value belongs to no key"},
        {headed("[-HKLM\\a]\n\"x\"=\"y\"\n"),             "3: the value belongs to no key"},
        {headed("[HKLM\\a\n"),                            "2: a key is not closed by a bracket at the end of its line"},
        {headed("[SOFTWARE\\a]\n"),                       "2: the key is in none of HKEY_LOCAL_MACHINE, HKEY_USERS and HKEY_CURRENT_USER"},
        {headed("[HKLM\\a\\\\b]\n"),                      "2: the key has a part without a name"},
        {headed("[HKLM\\" + std::string(256, 'x') + "]"), "2: the key has a part that no key can be named"},
        {headed("[-HKLM]\n"),                             "2: a root cannot be deleted"},
        {key + "x=\"y\"\n",                               "3: the line is no key, no value and no comment"},
        {key + "\"x\n",                                   "3: a text is not closed by a quotation mark on its line"},
        {key + "\"x\"=\"C:\\new\"\n",                     "3: a backslash in a text is not followed by a backslash or a quotation mark"},
        {key + "\"" + std::string(16384, 'x') + "\"=-\n", "3: no value can be named so"},
        {key + "\"x\"\n",                                 "3: there is no equals sign after the name"},
        {key + "\"x\"=5\n",                               "3: the data is no text, no dword and no hex list"},
        {key + "\"x\"=\"y\"z\n",                          "3: there is more on the line than its value"},
        {key + "\"x\"=dword:-1\n",                        "3: a dword is 1 to 8 hexadecimal digits"},
        {key + "\"x\"=hex(z):\n",                         "3: a type in brackets is 1 to 8 hexadecimal digits and a colon follows"},
        {key + "\"x\"=hex:0g\n",                          "3: a list of bytes is pairs of hexadecimal digits with commas between them"},
        {key + "\"x\"=hex:00,\\\n 11,\n",                 "4: the list ends in a comma"},
        {key + "\"x\"=hex:00,\\",                         "3: the file ends within a value"},
    };
    // clang-format on
    for (const auto& row : rows) {
        MemoryRegistry registry;
        EXPECT_EQ(importText(registry, headed(row.lines)), "") << row.why;
        EXPECT_EQ(exportAll(registry), headed(row.left)) << row.why;
        EXPECT_EQ(registry.openHandles(), 0U) << row.why;
    }
    for (const auto& row : bad) {
        MemoryRegistry registry;
        EXPECT_EQ(importText(registry, row.file), row.fault) << row.file.substr(0, 80);
        EXPECT_EQ(exportAll(registry), kHead) << row.fault;
    }
}

}  // namespace
}  // namespace kz7
