#include "install/src/copies/install_copies.h"

#include <algorithm>
#include <iterator>

namespace kz7 {
namespace {

constexpr std::uint32_t kCopyNameRoom = 256;  // bytes, the terminator included

char foldLower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

bool hasLetter(std::string_view text) {
    return std::any_of(text.begin(), text.end(), [](char c) { return foldUpper(c) != foldLower(c); });
}

}  // namespace

InstallCopyInfo::InstallCopyInfo(RegistryValues& values, std::string_view name, std::string_view copiesKey)
    : name_(name) {
    const std::string key = compose("%s\\%s\\CurrentVersion", {copiesKey, name});
    version_ = values.getValue(key, "Version");
    release_ = values.getValue(key, "Release");
    modification_ = values.getValue(key, "Modification");
    fixLevel_ = values.getValue(key, "Fix Level");
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
    FixedBuffer<kCopyNameRoom> name;
    for (std::uint32_t index = 0; succeeded(registry.enumerateKey(key.get(), index, name, nullptr)); ++index) {
        const InstallCopyInfo& copy =
            byName.insert_or_assign(std::string(name.text()), InstallCopyInfo(values, name.text())).first->second;
        if (copy.isValid()) {
            byVersion.insert_or_assign(copy.getVersion(), copy);
        }
        values.tell("%s version info of Install Copy '%s'",
                    {std::string_view(copy.isValid() ? "Valid" : "Invalid"), copy.getName()});
    }
    return kSuccess;
}

std::size_t commonLength(std::string_view left, std::string_view right) {
    const auto [end, other] = std::mismatch(left.begin(), left.end(), right.begin(), right.end());
    return static_cast<std::size_t>(end - left.begin());
}

const InstallCopyInfo* HighestVersions::leadingBy(std::string_view prefix, bool exact) {
    if (!hasLetter(prefix)) {
        return inMap(std::string(prefix), exact);
    }
    if (bothCases()) {
        const Table& table = exact ? exact_ : leading_;
        const auto found = table.find(prefix);
        return found == table.end() ? nullptr : found->second;
    }
    std::string written(prefix);
    std::transform(written.begin(), written.end(), written.begin(),
                   [this](char c) { return hasLower_ ? foldLower(c) : foldUpper(c); });
    return inMap(written, exact);
}

const InstallCopyInfo* HighestVersions::leadingByWhole(const CopiesByVersion::value_type& copy) {
    return hasLetter(copy.first) && bothCases() ? leadingBy(copy.first, true) : &copy.second;
}

const InstallCopyInfo* HighestVersions::inMap(const std::string& prefix, bool exact) const {
    if (exact) {
        const auto copy = copies_.find(prefix);
        return copy == copies_.end() ? nullptr : &copy->second;
    }
    // The texts that go on behind a dot lie together; the character behind the dot bounds them.
    const auto behind = copies_.lower_bound(prefix + static_cast<char>('.' + 1));
    const auto last = behind == copies_.begin() ? copies_.end() : std::prev(behind);
    return last != copies_.end() && last->first.starts_with(prefix + '.') ? &last->second : nullptr;
}

bool HighestVersions::bothCases() {
    if (!surveyed_) {
        surveyed_ = true;
        for (const auto& [text, copy] : copies_) {
            for (const char c : text) {
                hasUpper_ = hasUpper_ || c != foldLower(c);
                hasLower_ = hasLower_ || c != foldUpper(c);
            }
        }
        if (hasUpper_ && hasLower_) {
            fillTables();
        }
    }
    return hasUpper_ && hasLower_;
}

void HighestVersions::fillTables() {
    exact_.reserve(copies_.size());
    leading_.reserve(copies_.size());
    // From the greatest text down, the first that has a prefix is the one to keep.
    std::string_view greater;
    for (auto copy = copies_.rbegin(); copy != copies_.rend(); ++copy) {
        const std::string_view text = copy->first;
        exact_.try_emplace(text, &copy->second);
        // A dot within what both texts share ends a prefix that the greater one has answered.
        std::size_t dot = text.find('.', commonLength(text, greater));
        for (; dot != std::string_view::npos; dot = text.find('.', dot + 1)) {
            leading_.try_emplace(text.substr(0, dot), &copy->second);
        }
        greater = text;
    }
}

std::size_t HighestVersions::Hash::operator()(std::string_view text) const {
    std::uint64_t hash = 14695981039346656037U;  // FNV-1a
    for (const char c : text) {
        hash = (hash ^ static_cast<unsigned char>(foldUpper(c))) * 1099511628211U;
    }
    return static_cast<std::size_t>(hash);
}

}  // namespace kz7
