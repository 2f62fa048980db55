// Reads, writes and deletes single text values below HKEY_LOCAL_MACHINE for the copy records and the alias rewrite.
// Each operation opens its key and closes it; failures are described on the debugger output only.
#pragma once

#include <initializer_list>
#include <string>
#include <string_view>

#include "install/platform/console.h"
#include "install/platform/registry_store.h"
#include "install/platform/text.h"

namespace kz7 {

// Key paths hold no placeholder. Statuses are kSuccess or kFailed.
class RegistryValues {
public:
    RegistryValues(IRegistryStore& registry, IDebugOutput& debug) : registry_(registry), debug_(debug) {}

    // The value's data up to the first NUL, of any type. Empty on any failure and for 100 characters and more. The two
    // differ in their debugger text only.
    std::string getValue(std::string_view path, std::string_view name);
    std::string readValue(std::string_view path, std::string_view name);

    // Stores a string value in an existing key.
    Status setValue(std::string_view path, std::string_view name, std::string_view data);
    Status deleteValue(std::string_view path, std::string_view name);

    bool isHeard() { return debug_.isHeard(); }

    // Writes a message to the debugger output if anybody reads it.
    void tell(std::string_view pattern, std::initializer_list<Insert> inserts = {}) {
        if (isHeard()) {
            debug_.write(compose(pattern, inserts));
        }
    }

    IRegistryStore& registry() { return registry_; }

private:
    Status open(std::string_view path, AccessMask access, OwnedKey& key);
    std::string query(std::string_view path, std::string_view name, std::string_view complaint);

    IRegistryStore& registry_;
    IDebugOutput& debug_;
};

}  // namespace kz7
