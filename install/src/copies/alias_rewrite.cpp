#include "install/src/copies/alias_rewrite.h"

#include <algorithm>
#include <cstring>
#include <iterator>
#include <memory_resource>
#include <unordered_set>

#include "install/src/registry/registry_access.h"

namespace kz7 {
namespace {

constexpr std::size_t kWholeVersion = 4;  // components; after any other prefix a dot must follow

bool isLetter(char c) {
    return foldUpper(c) >= 'A' && foldUpper(c) <= 'Z';
}

// Finds aliases that differ only in letter case. They are not adjacent in the order of version texts: every lower-case
// letter is above every upper-case one.
using Alias = AliasMap::value_type;
struct IgnoringCase {
    std::size_t operator()(const Alias* alias) const {
        std::uint64_t hash = 0;
        for (std::string_view rest = alias->first; !rest.empty(); rest.remove_prefix(std::min(rest.size(), kPiece))) {
            std::uint64_t piece = 0;
            std::memcpy(&piece, rest.data(), std::min(rest.size(), kPiece));
            hash = (hash ^ (piece | kCaseBits)) * 0x9E3779B97F4A7C15U;
            hash ^= hash >> 32U;
        }
        return static_cast<std::size_t>(hash);
    }
    bool operator()(const Alias* left, const Alias* right) const { return equalsIgnoreCase(left->first, right->first); }

    static constexpr std::size_t kPiece = sizeof(std::uint64_t);
    static constexpr std::uint64_t kCaseBits = 0x2020202020202020U;  // the bit in which "A" and "a" differ
};
using AliasesIgnoringCase = std::pmr::unordered_set<const Alias*, IgnoringCase, IgnoringCase>;

// Computes the aliases of version texts that are added in descending order: the first copy that matches a prefix is the
// highest.
class AliasComputation {
public:
    AliasComputation(AliasMap& aliases, std::size_t versions) : aliases_(aliases) { matched_.reserve(versions); }

    void add(std::string_view text, const std::string& name) {
        const auto letter = static_cast<std::size_t>(std::find_if(text.begin(), text.end(), isLetter) - text.begin());
        // Texts that begin with one prefix and a dot are adjacent: the greater text has added what both have.
        const std::size_t shared = commonLength(text, greater_);
        while (!open_.empty() && open_.back()->first.size() >= shared) {
            open_.pop_back();
        }
        for (std::size_t end = open_.empty() ? 0 : open_.back()->first.size() + 1; end <= text.size(); ++end) {
            end = std::min(text.find('.', end), text.size());
            addPrefix(text.substr(0, end), end == text.size(), end > letter, name);
        }
        greater_ = text;
    }

    // Looks up the prefixes that only a copy spelled in other letters may match.
    void finish() {
        for (const auto& alias : unmatched_) {
            if (const auto first = matched_.find(&*alias); first != matched_.end()) {
                alias->second = (*first)->second;
            }
        }
    }

private:
    void addPrefix(std::string_view prefix, bool isText, bool hasLetter, const std::string& name) {
        const auto place = open_.empty() ? aliases_.begin() : std::next(open_.back());
        const auto alias = aliases_.try_emplace(place, std::string(prefix));
        open_.push_back(alias);
        // Deliberate: the fourth prefix matches exactly that version only, so that a version of five components gets
        // two empty aliases; a prefix that no copy matches is written all the same.
        if ((open_.size() == kWholeVersion) == isText) {
            const Alias* first = hasLetter ? *matched_.insert(&*alias).first : &*alias;
            alias->second = first == &*alias ? name : first->second;
        } else if (hasLetter) {
            unmatched_.push_back(alias);
        }
    }

    AliasMap& aliases_;
    std::pmr::monotonic_buffer_resource room_;
    AliasesIgnoringCase matched_{&room_};        // those with letters, in the spelling that was matched first
    std::vector<AliasMap::iterator> unmatched_;  // that a copy spelled in other letters may match
    std::vector<AliasMap::iterator> open_;       // the prefixes of the greater text
    std::string_view greater_;
};

}  // namespace

bool isAliasName(std::string_view name) {
    return !name.empty() && name.front() >= '0' && name.front() <= '9' && name.find("DEF") == std::string_view::npos;
}

bool isWholeVersion(std::string_view prefix) {
    return static_cast<std::size_t>(std::count(prefix.begin(), prefix.end(), '.')) + 1 == kWholeVersion;
}

AliasMap computeAliases(const CopiesByVersion& copies) {
    AliasMap aliases;
    AliasComputation computation(aliases, copies.size());
    for (auto version = copies.rbegin(); version != copies.rend(); ++version) {
        computation.add(version->first, version->second);
    }
    computation.finish();
    return aliases;
}

std::vector<std::string> listAliases(IRegistryStore& registry, KeyHandle key) {
    std::vector<std::string> names;
    TextBuffer<kAliasNameRoom> name;
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
    profileInfo_ = computeAliases(copiesByVersion_);
    tellProfile();
    return kSuccess;
}

void InstallCopiesProfile::tellProfile() {
    if (!values_.isHeard()) {
        return;
    }
    // Deliberate: once for each prefix, not for each copy that has it.
    for (const auto& [prefix, name] : profileInfo_) {
        if (name.empty()) {
            values_.tell("The highest version leading by '%s': ( none )", {prefix});
            values_.tell("Did not find corrsponding install name for '%s'", {prefix});
        } else {
            // Deliberate: the quotation mark is never closed, and "corrsponding" is misspelled; people search traces
            // for these texts.
            values_.tell("The highest version leading by '%s:%s--%s",
                         {prefix, copiesByName_.at(name).getVersion(), name});
        }
    }
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
        if (!succeeded(values_.deleteValue(path, name)) && !isGone(path, name)) {
            values_.tell("Failed to delete value name: %s\\%s", {path, name});
            allDeleted = false;
        }
    }
    return kSuccess;
}

// Another program may have deleted an alias since it was listed.
bool InstallCopiesProfile::isGone(std::string_view path, std::string_view name) {
    IRegistryStore& registry = values_.registry();
    OwnedKey key(registry);
    return succeeded(registry.openKey(KeyHandle::localMachine, path, kKeyQueryValue, key.receive())) &&
           !valueExists(registry, key.get(), name);
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
