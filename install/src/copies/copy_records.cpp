#include "install/src/copies/copy_records.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kCopyNameRoom = 256;  // characters, the terminator included

}  // namespace

InstallCopyInfo::InstallCopyInfo(RegistryValues& values, std::string_view name, std::string_view copiesKey)
    : name_(name) {
    const std::string key = compose("%s\\%s\\CurrentVersion", {copiesKey, name});
    version_ = values.getValue(key, "Version");
    release_ = values.getValue(key, "Release");
    modification_ = values.getValue(key, "Modification");
    fixLevel_ = values.getValue(key, "Fix Level");
    // Deliberate: set before the copy is judged, so that a missing fix level never makes it invalid.
    if (fixLevel_.empty()) {
        fixLevel_.push_back('0');
    }
    versionText_ = version_ + '.' + release_ + '.' + modification_ + '.' + fixLevel_;
    valid_ = !version_.empty() && !release_.empty() && !modification_.empty();
}

Status readInstallCopies(RegistryValues& values, CopiesByName& byName, CopiesByVersion& byVersion) {
    byName.clear();
    byVersion.clear();
    IRegistryStore& registry = values.registry();
    OwnedKey key(registry);
    if (!succeeded(registry.openKey(KeyHandle::localMachine, layout::kCopies, values.readAccess(), key.receive()))) {
        values.tell("Failed to open the registry key:%s", {layout::kCopies});
        return kFailed;
    }
    TextBuffer<kCopyNameRoom> name;
    for (std::uint32_t index = 0; succeeded(registry.enumerateKey(key.get(), index, name, nullptr)); ++index) {
        const InstallCopyInfo& copy =
            byName.insert_or_assign(std::string(name.text()), InstallCopyInfo(values, name.text())).first->second;
        if (copy.isValid()) {
            byVersion.emplace_back(copy.getVersion(), copy.getName());
        }
        values.tell("%s version info of Install Copy '%s'",
                    {std::string_view(copy.isValid() ? "Valid" : "Invalid"), copy.getName()});
    }
    std::stable_sort(byVersion.begin(), byVersion.end(),
                     [](const auto& left, const auto& right) { return left.first < right.first; });
    const auto first = std::unique(byVersion.rbegin(), byVersion.rend(),
                                   [](const auto& left, const auto& right) { return left.first == right.first; });
    byVersion.erase(byVersion.begin(), first.base());
    return kSuccess;
}

std::size_t commonLength(std::string_view left, std::string_view right) {
    const auto [end, other] = std::mismatch(left.begin(), left.end(), right.begin(), right.end());
    return static_cast<std::size_t>(end - left.begin());
}

std::string highestVersionLeadingBy(const CopiesByVersion& copies, std::string_view prefix, bool exact) {
    const auto answers = [&](const CopiesByVersion::value_type& copy) {
        const std::string_view text = copy.first;
        const bool hasLength =
            exact ? text.size() == prefix.size() : text.size() > prefix.size() && text[prefix.size()] == '.';
        return hasLength && equalsIgnoreCase(text.substr(0, prefix.size()), prefix);
    };
    const auto highest = std::find_if(copies.rbegin(), copies.rend(), answers);
    return highest == copies.rend() ? std::string{} : highest->second;
}

}  // namespace kz7
