// The installed copies as the version aliases see them: the record of one copy, the list of all, and the
// answer to "which copy is the highest of those whose version begins with this?".
#pragma once

#include <map>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "install/src/copies/registry_values.h"
#include "install/src/registry/copy_layout.h"

namespace kz7 {

// One copy. The version text joins its four fields with dots. Deliberate: texts, not numbers, are what orders copies,
// 10.1.0.0 is below 9.7.0.0; the aliases on every machine were chosen so.
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

// Version text and name of every valid copy, ordered by the texts, whose bytes compare unsigned. One behind the other
// in memory: the aliases are computed in one pass over them.
using CopiesByVersion = std::vector<std::pair<std::string, std::string>>;

// Reads the copies below the native view's key, in the order in which it lists them: of two copies with one
// version text the later stays. kFailed when the key cannot be opened, both maps are then empty.
Status readInstallCopies(RegistryValues& values, CopiesByName& byName, CopiesByVersion& byVersion);

// The name of the copy with the greatest version text that begins with `prefix` and a dot, or that is `exact`ly
// `prefix`, without regard to case. Empty when there is none. One question is a walk over the copies.
std::string highestVersionLeadingBy(const CopiesByVersion& copies, std::string_view prefix, bool exact);

// How many bytes two texts have in common from their beginning.
std::size_t commonLength(std::string_view left, std::string_view right);

}  // namespace kz7
