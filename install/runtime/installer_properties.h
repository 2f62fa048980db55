// Installer properties for immediate and deferred custom actions. The installer hides almost all properties from
// deferred actions, so an immediate action saves those that they will need in the registry of the installing user,
// where deferred reads look first; the saved values are deleted when the work is done.
#pragma once

#include <cstdint>

#include "install/platform/installer_session.h"
#include "install/platform/registry_store.h"
#include "install/runtime/ure.h"

namespace kz7 {

inline constexpr std::size_t kPropertySize = 1024;  // characters of a property's value with its NUL

// The running installation, its user's registry, and the engine that its traces go to. No exception leaves the
// operations below; kNoMemory: memory ran out.
struct Installation {
    IInstallerSession& session;
    IRegistryStore& registry;
    URE& ure;
};

// Reads a property into a buffer that may count characters; as below, but name and room are given.
Status readProperty(const Installation& at, const char* name, Buffer& value);

// Reads a property into `size` bytes. A deferred action reads the saved value first, but kReadableWhenScheduled first
// from the installer: the user can write the saved values. On success the value is terminated and `size` is what it
// took: without the NUL where the installer answered, with it where a deferred action read what was saved.
// kMissingItem: an immediate action gave no name or no buffer; kInvalidParameter: a deferred one gave no name, buffer
// or size; else the installer's status, kMoreData with its hint in `size`.
Status iMsiGetProperty(const Installation& at, const char* name, char* buffer, std::uint32_t* size);

// The installer's status. Null for a value unsets the property.
Status iMsiSetProperty(const Installation& at, const char* name, const char* value);

// Deletes what an earlier installation saved, then saves the properties of the installation's table, those of
// kSavedPropertyNames, the states of some features and the keywords of the response file; values that cannot be read or
// have kPropertySize characters and more are left out. The engine's product abbreviation becomes that of the property
// kProductKeyword, if it is set.
// kNoInstallationDatabase, or the first failure of the installer in giving the table.
Status iSavePropertiesForDeferred(const Installation& at);

// Deletes the saved values; succeeds if none exist.
Status iDeleteSavedProperties(const Installation& at);

// Traces the operation, property and status of a read or write for a named purpose.
void traceProperty(const Installation& at, std::string_view operation, std::string_view name, Status status);

}  // namespace kz7
