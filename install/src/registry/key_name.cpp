#include "install/src/registry/key_name.h"

#include <algorithm>

#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

struct Root {
    KeyHandle handle;
    std::string_view name;
    std::string_view abbreviation;
};

// clang-format off
constexpr std::array<Root, 3> kRoots = {{
    {KeyHandle::localMachine, "HKEY_LOCAL_MACHINE", "HKLM"},
    {KeyHandle::users,        "HKEY_USERS",         "HKU"},
    {KeyHandle::currentUser,  "HKEY_CURRENT_USER",  "HKCU"},
}};
// clang-format on

}  // namespace

bool parseKeyName(std::string_view text, KeyName& name) {
    const std::string_view first = text.substr(0, text.find('\\'));
    for (const Root& root : kRoots) {
        if (equalsIgnoreCase(first, root.name) || equalsIgnoreCase(first, root.abbreviation)) {
            name = {root.handle,
                    std::string(text.substr(first.size() == text.size() ? text.size() : first.size() + 1))};
            return true;
        }
    }
    return false;
}

KeyName typedKeyName(std::string_view text) {
    std::string names;
    for (std::string_view name; takeName(text, name);) {
        names.append(names.empty() ? "" : "\\").append(name);
    }
    KeyName typed;
    if (!parseKeyName(names, typed)) {
        typed = {KeyHandle::localMachine, std::move(names)};
    }
    return typed;
}

std::string fullKeyName(const KeyName& name) {
    std::string text;
    for (const Root& root : kRoots) {
        if (root.handle == name.root) {
            text = root.name;
        }
    }
    return name.path.empty() ? text : text + '\\' + name.path;
}

std::string walkPlace(std::string_view fullName) {
    std::string place = foldUpper(fullName);
    std::replace(place.begin(), place.end(), '\\', '\0');
    return place;
}

}  // namespace kz7
