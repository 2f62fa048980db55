#include "install/src/copies/copy_records.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kCopyNameRoom = 256;  // characters, the terminator included

// The name of a copy's four fields, in the order of its version text.
constexpr std::array<std::string_view, 4> kFields = {"Version", "Release", "Modification", "Fix Level"};

std::array<std::string, 4> readFields(RegistryValues& values, const std::string& key) {
    std::array<std::string, 4> fields;
    for (std::size_t field = 0; field < fields.size(); ++field) {
        fields[field] = values.getValue(key, kFields[field]);
    }
    return fields;
}

}  // namespace

InstallCopyInfo::InstallCopyInfo(RegistryValues& values, std::string_view name)
    : InstallCopyInfo(name, readFields(values, compose("%s\\%s\\CurrentVersion", {layout::kCopies, name}))) {}

InstallCopyInfo::InstallCopyInfo(std::string_view name, std::array<std::string, 4> fields) : name_(name) {
    // Deliberate: set before the copy is judged, so that a missing fix level never makes it invalid.
    if (fields[3].empty()) {
        fields[3].push_back('0');
    }
    versionText_ = fields[0] + '.' + fields[1] + '.' + fields[2] + '.' + fields[3];
    valid_ = !fields[0].empty() && !fields[1].empty() && !fields[2].empty();
}

Status readInstallCopies(RegistryValues& values, CopiesByName& byName, CopiesByVersion& byVersion) {
    byName.clear();
    byVersion.clear();
    IRegistryStore& registry = values.registry();
    OwnedKey key(registry);
    if (!succeeded(registry.openKey(KeyHandle::localMachine, layout::kCopies, kKeyReadSet, key.receive()))) {
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
    orderByVersion(byVersion);
    return kSuccess;
}

void orderByVersion(CopiesByVersion& copies) {
    std::stable_sort(copies.begin(), copies.end(),
                     [](const auto& left, const auto& right) { return left.first < right.first; });
    const auto first = std::unique(copies.rbegin(), copies.rend(),
                                   [](const auto& left, const auto& right) { return left.first == right.first; });
    copies.erase(copies.begin(), first.base());
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
