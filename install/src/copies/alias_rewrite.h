// The version aliases: values directly below the key of the installed copies. The name of an alias is a version prefix
// (9, 9.7, 9.7.0, ...), its data the name of the copy with the highest version that begins with it. The rewrite
// computes the aliases from the installed copies and replaces the old ones in both views.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "install/src/copies/copy_records.h"

namespace kz7 {

using AliasMap = std::map<std::string, std::string>;  // version prefix or value name -> copy name

// Whether a value of that name is an alias: it begins with a digit and does not contain "DEF".
bool isAliasName(std::string_view name);

// Whether a prefix is a whole version, which only a copy of exactly that version matches.
bool isWholeVersion(std::string_view prefix);

// Characters of the name buffer of a walk over the aliases, with the terminator.
inline constexpr std::uint32_t kAliasNameRoom = 100;

// The names of the aliases of an open key, in registry order. Deliberate: the walk ends at the first value name of 100
// characters or more; aliases after it are left alone.
std::vector<std::string> listAliases(IRegistryStore& registry, KeyHandle key);

// The aliases of copies in the order of their versions. A prefix that no copy matches has an empty name.
AliasMap computeAliases(const CopiesByVersion& copies);

// Statuses are kSuccess or kFailed; failures are described on the debugger output. An object may be run again.
class InstallCopiesProfile {
public:
    InstallCopiesProfile(IRegistryStore& registry, IDebugOutput& debug) : values_(registry, debug) {}

    // The whole rewrite. A failure before the first deletion changes nothing; a failed deletion restores the old
    // aliases; failed writes leave the aliases that could be written.
    Status run();

    // The steps of run(). The maps that they fill stay filled until cleanup().
    Status backupOldProfile();
    Status generateInstallCopiesList();
    Status generateProfileInfo();
    Status deleteOldProfile();
    void restoreOldProfile();
    void cleanup();

    const CopiesByName& copiesByName() const { return copiesByName_; }
    const CopiesByVersion& copiesByVersion() const { return copiesByVersion_; }

    // The computed aliases. A prefix that no copy matches has an empty name.
    const AliasMap& profileInfo() const { return profileInfo_; }

private:
    Status rewrite();
    Status listAliases(std::string_view path, std::vector<std::string>& names);
    Status backup(std::string_view path, AliasMap& profile);
    bool isGone(std::string_view path, std::string_view name);
    Status deleteAliases(std::string_view path, bool& allDeleted);
    Status writeProfile();
    void tellProfile();

    RegistryValues values_;
    CopiesByName copiesByName_;
    CopiesByVersion copiesByVersion_;
    AliasMap profileInfo_;
    AliasMap oldProfile_;
    AliasMap oldProfileWow_;
};

// Runs the rewrite once.
Status rewriteInstallCopiesProfile(IRegistryStore& registry, IDebugOutput& debug);

}  // namespace kz7
