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

// As below, for a buffer whose limit may count characters; the name and the buffer are not null.
Status readProperty(const Installation& at, const char* name, Buffer& value);

// Reads a property into `size` bytes. A deferred action reads the saved value first, but kReadableWhenScheduled first
// from the installer: the user can write the saved values. On success the value is terminated and `size` is its size:
// with the NUL for a saved value, without it for a value of the installer. kInvalidParameter: an argument is null;
// kMissingItem: the name or the buffer is null in an immediate action; else the installer's status, for kMoreData with
// its hint in `size`.
Status iMsiGetProperty(const Installation& at, const char* name, char* buffer, std::uint32_t* size);

// Returns the installer's status. A null value unsets the property.
Status iMsiSetProperty(const Installation& at, const char* name, const char* value);

// Deletes what an earlier installation saved, then saves the properties of the installation's table, those of
// kSavedPropertyNames, the states of some features and the keywords of the response file; values that cannot be read or
// have kPropertySize characters and more are left out. The engine's product abbreviation becomes that of the property
// kProductKeyword, if it is set.
// Returns kNoInstallationDatabase, or the first failure to read the table.
Status iSavePropertiesForDeferred(const Installation& at);

// Deletes the saved values; succeeds if none exist.
Status iDeleteSavedProperties(const Installation& at);

// Traces the operation, property and status of a read or write for a named purpose.
void traceProperty(const Installation& at, std::string_view operation, std::string_view name, Status status);

}  // namespace kz7
