// Single text values of the machine's registry, as the copy records and the alias rewrite read, write and
// delete them. Every operation opens its key, does one thing and closes it; what went wrong is composed for
// the debugger output alone.
#pragma once

#include <initializer_list>
#include <string>
#include <string_view>

#include "install/platform/debug_output.h"
#include "install/platform/registry_store.h"
#include "install/platform/text.h"

namespace kz7 {

// Key paths are plain paths below the machine's root. Statuses are kSuccess or kFailed.
class RegistryValues {
public:
    // `readAccess` is what keys are opened with to be read; who only looks needs less than the flows ask for.
    RegistryValues(IRegistryStore& registry, IDebugOutput& debug, AccessMask readAccess = kKeyReadSet)
        : registry_(registry), debug_(debug), readAccess_(readAccess) {}

    // The value's data up to the first NUL, whatever its type. Empty on any failure, and for 100 characters
    // and more, so that a missing value and an empty one look alike. Both are one operation; they differ in
    // what they tell the debugger.
    std::string getValue(std::string_view path, std::string_view name);
    std::string readValue(std::string_view path, std::string_view name);

    // Stores a string value in a key that exists.
    Status setValue(std::string_view path, std::string_view name, std::string_view data);
    Status deleteValue(std::string_view path, std::string_view name);

    bool isHeard() { return debug_.isHeard(); }

    // Composes a message for the debugger output, if anybody sees it.
    void tell(std::string_view pattern, std::initializer_list<Insert> inserts = {}) {
        if (isHeard()) {
            debug_.write(compose(pattern, inserts));
        }
    }

    IRegistryStore& registry() { return registry_; }
    AccessMask readAccess() const { return readAccess_; }

private:
    Status open(std::string_view path, AccessMask access, OwnedKey& key);
    std::string query(std::string_view path, std::string_view name, std::string_view complaint);

    IRegistryStore& registry_;
    IDebugOutput& debug_;
    AccessMask readAccess_;
};

}  // namespace kz7
