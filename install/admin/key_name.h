// Names of keys as people and files write them, with their root in front, and what the programs of the product
// keep in a registry that is not theirs alone.
#pragma once

#include <array>
#include <string>
#include <string_view>

#include "install/platform/registry_store.h"

namespace kz7 {

// A key: a root and the path below it.
struct KeyName {
    KeyHandle root = KeyHandle::none;
    std::string path;
};

// Takes "HKEY_LOCAL_MACHINE\a\b" or "HKLM\a\b" apart, and so for the users' and the caller's root; case does
// not matter. False when the text begins with no root.
bool parseKeyName(std::string_view text, KeyName& name);

// The same for what a person types: without a root it lies below HKEY_LOCAL_MACHINE, and only separators
// between names count, a run of them as one.
KeyName typedKeyName(std::string_view text);

// With the root's full name.
std::string fullKeyName(const KeyName& name);

// Below HKEY_LOCAL_MACHINE. One that ends in '*' stands for every key whose name begins so.
// clang-format off
inline constexpr std::array<std::string_view, 6> kProductKeys = {
    "SOFTWARE\\NVQ\\KZ7",
    "SOFTWARE\\NVQ\\KZ7BackupV8",
    "SOFTWARE\\Wow6432Node\\NVQ\\KZ7",
    "SOFTWARE\\Wow6432Node\\NVQ\\KZ7BackupV8",
    "SYSTEM\\CurrentControlSet\\Services\\EventLog\\Application\\KZ7 Management Service",
    "SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC*",
};
// clang-format on

}  // namespace kz7
