// The profile registry of a copy: the variables that its programs read, for one instance or for all of the copy.
#pragma once

#include <string>
#include <string_view>

#include "install/platform/registry_store.h"

namespace kz7 {

inline constexpr std::string_view kGlobalProfile = "KZ7GLOBALPF";  // the instance name of the whole copy

// The store outlives it. Changes wait for settle(). No exception leaves an operation; kNoMemory: memory ran out.
class ProfileRegistry {
public:
    ProfileRegistry(IRegistryStore& registry, std::string_view copyName);

    // Sets a variable of a copy that has a key; the empty value removes it. kVariableNotThere: the variable to remove
    // does not exist.
    Status set(std::string_view instance, std::string_view variable, std::string_view value);

    // Commits: other programs, including ones that are started now, see the changes and can write.
    Status settle();

    // kVariableNotThere: it is not set; kMoreData: it is longer than any variable can be.
    Status get(std::string_view instance, std::string_view variable, std::string& value);

private:
    Status write(const std::string& profile, std::string_view variable, std::string_view value);
    Status read(std::string_view instance, std::string_view variable, std::string& value);
    Status remove(const std::string& key, std::string_view variable);
    std::string keyOf(std::string_view instance) const;

    IRegistryStore& registry_;
    std::string copyPath_;
};

}  // namespace kz7
