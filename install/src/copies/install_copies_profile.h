// The version aliases: values directly under the key of the installed copies, named by a version prefix (9,
// 9.7, 9.7.0, ...) and holding the name of the copy that answers to it, the highest that begins with it. The
// rewrite computes them from the copies that are installed now and replaces the old ones in both views.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "install/src/copies/install_copies.h"

namespace kz7 {

using AliasMap = std::map<std::string, std::string>;  // version prefix or value name -> copy name

// Whether a value of that name is an alias: it begins with a digit and "DEF" is nowhere in it.
bool isAliasName(std::string_view name);

// Whether a prefix stands for one whole version, so that only a copy of exactly that version answers to it.
bool isWholeVersion(std::string_view prefix);

// A walk over aliases takes value names of fewer bytes.
inline constexpr std::uint32_t kAliasNameRoom = 100;

// Names of the aliases that an open key holds, in its order. Deliberate: the walk ends at the first value name
// that has 100 bytes or more; aliases listed behind it are left alone.
std::vector<std::string> listAliases(IRegistryStore& registry, KeyHandle key);

// Statuses are kSuccess or kFailed; what failed goes to the debugger output. An object may be run again.
class InstallCopiesProfile {
public:
    InstallCopiesProfile(IRegistryStore& registry, IDebugOutput& debug, AccessMask readAccess = kKeyReadSet)
        : values_(registry, debug, readAccess) {}

    // The whole rewrite. A failure before the first deletion changes nothing, one while deleting puts the
    // old aliases back, one while writing leaves what could be written.
    Status run();

    // Its steps. The maps that they fill stay filled until cleanup.
    Status backupOldProfile();
    Status generateInstallCopiesList();
    Status generateProfileInfo();
    Status deleteOldProfile();
    void restoreOldProfile();
    void cleanup();

    const CopiesByName& copiesByName() const { return copiesByName_; }
    const CopiesByVersion& copiesByVersion() const { return copiesByVersion_; }

    // What the aliases should be. A prefix that no copy answers to has an empty name.
    const AliasMap& profileInfo() const { return profileInfo_; }

private:
    Status rewrite();
    Status listAliases(std::string_view path, std::vector<std::string>& names);
    Status backup(std::string_view path, AliasMap& profile);
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

// The rewrite by itself.
Status rewriteInstallCopiesProfile(IRegistryStore& registry, IDebugOutput& debug);

}  // namespace kz7
