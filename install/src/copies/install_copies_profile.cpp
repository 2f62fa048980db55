#include "install/src/copies/install_copies_profile.h"

#include <algorithm>

namespace kz7 {
namespace {

constexpr std::uint32_t kAliasNameRoom = 100;  // bytes, the terminator included
constexpr std::ptrdiff_t kWholeVersion = 4;    // components; any other prefix must go on behind a dot

}  // namespace

bool isAliasName(std::string_view name) {
    return !name.empty() && name.front() >= '0' && name.front() <= '9' && name.find("DEF") == std::string_view::npos;
}

bool isWholeVersion(std::string_view prefix) {
    return std::count(prefix.begin(), prefix.end(), '.') + 1 == kWholeVersion;
}

std::vector<std::string> listAliases(IRegistryStore& registry, KeyHandle key) {
    std::vector<std::string> names;
    FixedBuffer<kAliasNameRoom> name;
    for (std::uint32_t index = 0; succeeded(registry.enumerateValue(key, index, name, nullptr, nullptr)); ++index) {
        if (isAliasName(name.text())) {
            names.emplace_back(name.text());
        }
    }
    return names;
}

Status InstallCopiesProfile::run() {
    const Status status = rewrite();
    cleanup();
    return status;
}

Status InstallCopiesProfile::rewrite() {
    const auto fail = [this](std::string_view complaint) {
        values_.tell(complaint);
        return kFailed;
    };
    if (!succeeded(backupOldProfile())) {
        return fail("Failed to backup the old profile info");
    }
    if (!succeeded(generateInstallCopiesList())) {
        return fail("Failed to generate the Install Copies List");
    }
    if (!succeeded(generateProfileInfo())) {
        return fail("Failed to generate the Install Copies Profile Info");
    }
    if (!succeeded(deleteOldProfile())) {
        fail("Failed to delete old profile");
        restoreOldProfile();
        return kFailed;
    }
    return writeProfile();
}

Status InstallCopiesProfile::listAliases(std::string_view path, std::vector<std::string>& names) {
    IRegistryStore& registry = values_.registry();
    OwnedKey key(registry);
    if (!succeeded(registry.openKey(KeyHandle::localMachine, path, kKeyFull, key.receive()))) {
        values_.tell("Failed to open the registry key: %s", {path});
        return kFailed;
    }
    names = kz7::listAliases(registry, key.get());
    return kSuccess;
}

Status InstallCopiesProfile::backupOldProfile() {
    const Status status = backup(layout::kCopies, oldProfile_);
    return succeeded(status) ? backup(layout::kCopies32, oldProfileWow_) : status;
}

Status InstallCopiesProfile::backup(std::string_view path, AliasMap& profile) {
    profile.clear();
    std::vector<std::string> names;
    if (!succeeded(listAliases(path, names))) {
        return kFailed;
    }
    for (const std::string& name : names) {
        profile[name] = values_.readValue(path, name);
    }
    return kSuccess;
}

Status InstallCopiesProfile::generateInstallCopiesList() {
    return readInstallCopies(values_, copiesByName_, copiesByVersion_);
}

Status InstallCopiesProfile::generateProfileInfo() {
    profileInfo_.clear();
    HighestVersions highest(copiesByVersion_);
    std::string_view lesser;
    for (const auto& copy : copiesByVersion_) {
        const std::string_view text = copy.first;
        const std::size_t shared = commonLength(text, lesser);
        std::ptrdiff_t component = 0;
        for (std::size_t end = 0; end <= text.size(); ++end) {
            end = std::min(text.find('.', end), text.size());
            ++component;
            if (end < shared) {
                continue;  // the text before has this prefix too, and it answers alike
            }
            const std::string_view prefix = text.substr(0, end);
            const bool exact = component == kWholeVersion;
            profileInfo_.insert_or_assign(
                profileInfo_.end(), std::string(prefix),
                nameFor(prefix,
                        exact && end == text.size() ? highest.leadingByWhole(copy) : highest.leadingBy(prefix, exact)));
        }
        lesser = text;
    }
    return kSuccess;
}

std::string InstallCopiesProfile::nameFor(std::string_view prefix, const InstallCopyInfo* highest) {
    if (highest == nullptr) {
        values_.tell("The highest version leading by '%s': ( none )", {prefix});
        values_.tell("Did not find corrsponding install name for '%s'", {prefix});
        return {};
    }
    // Deliberate: the quotation mark is never closed; whoever searches traces knows the text so.
    values_.tell("The highest version leading by '%s:%s--%s", {prefix, highest->getVersion(), highest->getName()});
    return highest->getName();
}

Status InstallCopiesProfile::deleteOldProfile() {
    bool allDeleted = true;
    for (const std::string_view path : {layout::kCopies, layout::kCopies32}) {
        if (!succeeded(deleteAliases(path, allDeleted))) {
            return kFailed;
        }
    }
    return allDeleted ? kSuccess : kFailed;
}

Status InstallCopiesProfile::deleteAliases(std::string_view path, bool& allDeleted) {
    std::vector<std::string> names;
    if (!succeeded(listAliases(path, names))) {
        return kFailed;
    }
    for (const std::string& name : names) {
        if (!succeeded(values_.deleteValue(path, name))) {
            values_.tell("Failed to delete value name: %s\\%s", {path, name});
            allDeleted = false;
        }
    }
    return kSuccess;
}

void InstallCopiesProfile::restoreOldProfile() {
    const auto restore = [this](std::string_view path, const AliasMap& profile) {
        for (const auto& [name, copy] : profile) {
            if (!succeeded(values_.setValue(path, name, copy))) {
                values_.tell("Failed to restore the value of: %s\\%s", {path, name});
            }
        }
    };
    restore(layout::kCopies, oldProfile_);
    restore(layout::kCopies32, oldProfileWow_);
}

Status InstallCopiesProfile::writeProfile() {
    Status status = kSuccess;
    for (const auto& [prefix, copy] : profileInfo_) {
        for (const std::string_view path : {layout::kCopies, layout::kCopies32}) {
            if (!succeeded(values_.setValue(path, prefix, copy))) {
                values_.tell("Failed to update the value of '%s\\%s'", {path, prefix});
                status = kFailed;
            }
        }
    }
    return status;
}

void InstallCopiesProfile::cleanup() {
    copiesByName_.clear();
    copiesByVersion_.clear();
    profileInfo_.clear();
    oldProfile_.clear();
    oldProfileWow_.clear();
}

Status rewriteInstallCopiesProfile(IRegistryStore& registry, IDebugOutput& debug) {
    return InstallCopiesProfile(registry, debug).run();
}

}  // namespace kz7
