#include "install/src/registry/key_name.h"

#include <algorithm>

#include "install/platform/assembly_records.h"
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
    const auto* const root =
        std::find_if(kRoots.begin(), kRoots.end(), [&](const Root& known) { return known.handle == name.root; });
    const std::string_view rootName = root == kRoots.end() ? std::string_view{} : root->name;
    std::string text;
    text.reserve(rootName.size() + 1 + name.path.size());
    return text.append(rootName).append(name.path.empty() ? "" : "\\").append(name.path);
}

std::string walkPlace(std::string_view fullName) {
    std::string place(fullName);
    std::transform(place.begin(), place.end(), place.begin(), [](char c) { return c == '\\' ? '\0' : foldUpper(c); });
    return place;
}

bool isProductKey(const KeyName& name) {
    const auto covers = [&](std::string_view key) {
        const bool isPrefix = key.ends_with('*');
        key.remove_suffix(isPrefix ? 1 : 0);
        const std::size_t common = std::min(key.size(), name.path.size());
        if (!equalsIgnoreCase(key.substr(0, common), std::string_view(name.path).substr(0, common))) {
            return false;
        }
        return name.path.size() == key.size() || (name.path.size() < key.size() && key[common] == '\\') ||
               (name.path.size() > key.size() && (isPrefix || name.path[common] == '\\'));
    };
    return name.root == KeyHandle::localMachine &&
           (std::any_of(kProductKeys.begin(), kProductKeys.end(), covers) || covers(kAssemblyRecords));
}

}  // namespace kz7
