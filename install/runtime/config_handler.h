// Applies the configuration that an installer collected to an installed copy: variables of its profile registry, and
// parameters of an instance's database manager, which the copy's command processor sets. Values are recorded first and
// committed together; the outcome of each is reported, and no failure stops the others.
#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>

#include "install/platform/text.h"
#include "install/runtime/configuration_tables.h"
#include "install/runtime/profile_registry.h"
#include "install/runtime/ure.h"

namespace kz7 {

inline constexpr std::size_t kMaxInstanceName = 8;  // characters; longer names are truncated

// The target of a configuration: an instance if both names are set, else the whole copy.
struct ConfigurationTarget {
    FixedText<kMaxInstanceName + 1> instance;
    FixedText<kMaxInstanceName + 1> profile;  // the instance's in the profile registry

    bool isInstance() const { return !instance.empty() && !profile.empty(); }
};

// No exception leaves an operation; kNoMemory: memory ran out, and the object stays usable.
class KZ7CfgHandler {
public:
    // The engine, which has the location of the copy, and the profile registry outlive it.
    KZ7CfgHandler(URE& ure, ProfileRegistry& profile, const ConfigurationTarget& target)
        : ure_(ure), profile_(profile), target_(target) {}

    // Record a value, which replaces an earlier one; an empty value removes the variable. Names compare without case.
    // kUnknownVariable: no such variable; kMissingItem: no such parameter.
    Status recordVariable(std::string_view name, std::string_view value);
    Status recordParameter(std::string_view name, std::string_view value);

    // Called after each program run of commitDBMCfg().
    void setFollowUp(std::function<void()> followUp) { followUp_ = std::move(followUp); }

    // Sets the recorded variables. The code of the last failure, or success.
    Status commitProfileReg();

    // Sets the recorded parameters of an instance. Success even if some were not set.
    Status commitDBMCfg(std::string_view instance);

    // Sets one parameter at once; a null instance is the global profile. A command processor that fails is traced and
    // counts as success. kNoSystemFile: the instance has no profile folder or no system file, or no parameter has that
    // identifier; kParameterNotSet: the value cannot be part of a command.
    Status set_dbm_parameter(const char* instance, std::uint32_t identifier, std::string_view value);

    // A variable of the target with the value of its first read. kUnknownVariable, or the profile registry's status.
    Status getVariable(std::string_view name, std::string& value);

    // The numbers of variables and parameters that could not be set, and that were set, so far.
    std::uint32_t failures() const { return failures_; }
    std::uint32_t successes() const { return successes_; }

private:
    using Pending = std::optional<std::string>;

    std::string_view profileName() const { return target_.isInstance() ? target_.profile.view() : kGlobalProfile; }
    Status setVariable(const RegistryVariable& variable, const std::string& value);
    Status set(const char* instance, std::uint32_t identifier, std::string_view value);
    Status commitParameters(std::string_view instance);
    Status readVariable(std::string_view name, std::string_view profile, std::string& value);
    Status setParameter(std::string_view instance, std::uint32_t identifier, std::string_view value,
                        const std::string& folder, bool& ran);
    Status runProcessor(const std::string& folder, std::string_view parameter, std::string_view value, bool& ran);
    void tellSet(Status message, std::initializer_list<Insert> inserts);
    void tellNotSet(Status message, std::initializer_list<Insert> inserts);

    URE& ure_;
    ProfileRegistry& profile_;
    ConfigurationTarget target_;
    std::array<Pending, kRegistryVariables.size()> variables_;
    std::array<Pending, kDatabaseManagerParameters.size()> parameters_;
    std::array<Pending, kRegistryVariables.size()> read_;  // variables that were read before
    std::function<void()> followUp_;
    std::uint32_t failures_ = 0;
    std::uint32_t successes_ = 0;
};

}  // namespace kz7
