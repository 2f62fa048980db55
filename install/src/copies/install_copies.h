// The installed copies as the version aliases see them: the record of one copy, the list of all, and the
// answer to "which copy is the highest of those whose version begins with this?".
#pragma once

#include <map>
#include <string>
#include <string_view>
#include <unordered_map>

#include "install/platform/text.h"
#include "install/src/copies/registry_values.h"
#include "install/src/copy_layout.h"

namespace kz7 {

// One copy. The version text joins its four fields with dots; texts, not numbers, are what orders copies:
// 10.1.0.0 is below 9.7.0.0.
class InstallCopyInfo {
public:
    InstallCopyInfo() = default;

    // Reads the copy below `copiesKey`. It never fails: what cannot be read stays empty.
    InstallCopyInfo(RegistryValues& values, std::string_view name, std::string_view copiesKey = layout::kCopies);

    const std::string& getName() const { return name_; }
    const std::string& getVersion() const { return versionText_; }

    // Version, release and modification are there; a missing fix level counts as "0".
    bool isValid() const { return valid_; }

private:
    std::string name_;
    std::string versionText_;
    std::string version_;
    std::string release_;
    std::string modification_;
    std::string fixLevel_;
    bool valid_ = false;
};

using CopiesByName = std::map<std::string, InstallCopyInfo>;
using CopiesByVersion = std::map<std::string, InstallCopyInfo>;  // valid copies only; bytes compare unsigned

// Reads the copies below the native view's key, in the order in which it lists them: of two copies with one
// version text the later stays. kFailed when the key cannot be opened, both maps are then empty.
Status readInstallCopies(RegistryValues& values, CopiesByName& byName, CopiesByVersion& byVersion);

// The highest copy for every prefix. It refers to the map, which must stay as it is.
class HighestVersions {
public:
    explicit HighestVersions(const CopiesByVersion& copies) : copies_(copies) {}

    // The copy with the greatest version text that begins with `prefix` and a dot, or that is `exact`ly
    // `prefix`, without regard to case. Null when there is none.
    const InstallCopyInfo* leadingBy(std::string_view prefix, bool exact);

    // The same for the whole text of a copy in the map, exactly: itself, unless another case of it is higher.
    const InstallCopyInfo* leadingByWhole(const CopiesByVersion::value_type& copy);

private:
    // The texts that share a prefix lie together in the map. Only where letters are written in both cases do
    // those that are equal but for case lie apart (every lower-case letter is above every upper-case one); there
    // they meet in tables, which are made when the first prefix with a letter is asked for.
    struct Hash {
        std::size_t operator()(std::string_view text) const;
    };
    struct Equal {
        bool operator()(std::string_view left, std::string_view right) const { return equalsIgnoreCase(left, right); }
    };
    using Table = std::unordered_map<std::string_view, const InstallCopyInfo*, Hash, Equal>;

    const InstallCopyInfo* inMap(const std::string& prefix, bool exact) const;
    bool bothCases();
    void fillTables();

    const CopiesByVersion& copies_;
    bool surveyed_ = false;
    bool hasUpper_ = false;
    bool hasLower_ = false;
    Table leading_;
    Table exact_;
};

// How many bytes two texts have in common from their beginning.
std::size_t commonLength(std::string_view left, std::string_view right);

}  // namespace kz7
