// The installed copies that the version aliases are computed from: the record of one copy, the list of all, and the
// query for the copy with the highest version that begins with a prefix.
#pragma once

#include <array>
#include <map>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "install/src/copies/registry_values.h"
#include "install/src/registry/copy_layout.h"

namespace kz7 {

// One copy. Its version text joins the four version fields with dots. Deliberate: copies are ordered by these texts,
// not by numbers, so that 10.1.0.0 is below 9.7.0.0; existing aliases were chosen that way.
class InstallCopyInfo {
public:
    InstallCopyInfo() = default;

    // Reads the copy of the native view. Never fails: a field that cannot be read is empty.
    InstallCopyInfo(RegistryValues& values, std::string_view name);

    // The same from the four fields, in the order of the version text.
    InstallCopyInfo(std::string_view name, std::array<std::string, 4> fields);

    const std::string& getName() const { return name_; }
    const std::string& getVersion() const { return versionText_; }

    // Whether the copy has a version, a release and a modification; a missing fix level counts as "0".
    bool isValid() const { return valid_; }

private:
    std::string name_;
    std::string versionText_;
    bool valid_ = false;
};

using CopiesByName = std::map<std::string, InstallCopyInfo>;

// The version texts and names of the valid copies, ordered by the texts, whose bytes compare as unsigned. Contiguous in
// memory, since the aliases are computed in one pass over them.
using CopiesByVersion = std::vector<std::pair<std::string, std::string>>;

// Sorts valid copies, which are in registry order, by their version texts; of two with the same text the later one
// stays.
void orderByVersion(CopiesByVersion& copies);

// Reads the copies of the native view in registry order: of two copies with the same version text the later one is
// kept. kFailed if the key cannot be opened; both containers are then empty.
Status readInstallCopies(RegistryValues& values, CopiesByName& byName, CopiesByVersion& byVersion);

// The name of the copy with the greatest version text that begins with `prefix` and a dot, or with `exact` equals
// `prefix`, without regard to case. Empty if no copy matches. Each call walks the copies.
std::string highestVersionLeadingBy(const CopiesByVersion& copies, std::string_view prefix, bool exact);

// The length in bytes of the longest common prefix.
std::size_t commonLength(std::string_view left, std::string_view right);

}  // namespace kz7
