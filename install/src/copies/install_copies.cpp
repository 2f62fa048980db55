#include "install/src/copies/install_copies.h"

#include <algorithm>
#include <iterator>

namespace kz7 {
namespace {

constexpr std::uint32_t kCopyNameRoom = 256;  // bytes, the terminator included

std::size_t firstLetter(std::string_view text) {
    const auto* letter =
        std::find_if(text.begin(), text.end(), [](char c) { return foldUpper(c) >= 'A' && foldUpper(c) <= 'Z'; });
    return letter == text.end() ? std::string_view::npos : static_cast<std::size_t>(letter - text.begin());
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

void HighestVersions::fillTables() {
    // From the greatest text down, the first that has a prefix is the one to keep.
    for (auto copy = copies_.rbegin(); copy != copies_.rend(); ++copy) {
        const std::string_view text = copy->first;
        const std::size_t letter = firstLetter(text);
        if (letter == std::string_view::npos) {
            continue;
        }
        exact_.try_emplace(text, &copy->second);
        for (std::size_t dot = text.find('.', letter); dot != std::string_view::npos; dot = text.find('.', dot + 1)) {
            leading_.try_emplace(text.substr(0, dot), &copy->second);
        }
    }
}

const InstallCopyInfo* HighestVersions::leadingBy(std::string_view prefix, bool exact) {
    if (firstLetter(prefix) != std::string_view::npos) {
        if (exact_.empty()) {
            fillTables();
        }
        const Table& table = exact ? exact_ : leading_;
        const auto found = table.find(prefix);
        return found == table.end() ? nullptr : found->second;
    }
    if (exact) {
        const auto copy = copies_.find(std::string(prefix));
        return copy == copies_.end() ? nullptr : &copy->second;
    }
    // The texts that go on behind a dot lie together; the character behind the dot bounds them.
    const std::string begin = std::string(prefix) + '.';
    const auto behind = copies_.lower_bound(std::string(prefix) + static_cast<char>('.' + 1));
    const auto last = behind == copies_.begin() ? copies_.end() : std::prev(behind);
    return last != copies_.end() && last->first.starts_with(begin) ? &last->second : nullptr;
}

const InstallCopyInfo* HighestVersions::leadingByWhole(const CopiesByVersion::value_type& copy) {
    return firstLetter(copy.first) == std::string::npos ? &copy.second : leadingBy(copy.first, true);
}

std::size_t HighestVersions::Hash::operator()(std::string_view text) const {
    std::uint64_t hash = 14695981039346656037U;  // FNV-1a
    for (const char c : text) {
        hash = (hash ^ static_cast<unsigned char>(foldUpper(c))) * 1099511628211U;
    }
    return static_cast<std::size_t>(hash);
}

}  // namespace kz7
