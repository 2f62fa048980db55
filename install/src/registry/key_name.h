// Key names with their root, as users and files write them, and the product's keys in a machine's registry.
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

// Splits "HKEY_LOCAL_MACHINE\a\b" or "HKLM\a\b", and the same for HKEY_USERS and HKEY_CURRENT_USER; ignores case.
// False if the text does not begin with a root.
bool parseKeyName(std::string_view text, KeyName& name);

// The same for a name from the command line: the default root is HKEY_LOCAL_MACHINE, and leading, trailing and repeated
// separators are ignored.
KeyName typedKeyName(std::string_view text);

// The name with the root's full name.
std::string fullKeyName(const KeyName& name);

// What a full key name sorts by in a walk: case is ignored, and a separator comes before every character of a name.
std::string walkPlace(std::string_view fullName);

// Below HKEY_LOCAL_MACHINE. A trailing '*' matches every key whose name begins with the text before it.
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

// Whether a key is one of those, below one of them, or above one of them.
bool isProductKey(const KeyName& name);

}  // namespace kz7
