// The rules for key paths and names. Windows checks most of them itself, but its versions differ; what is checked here
// has the same result on every store.
#pragma once

#include <string>
#include <string_view>

#include "install/platform/registry_store.h"

namespace kz7 {

// Takes the first name off `path`; runs of separators count as one. False when no name is left.
bool takeName(std::string_view& path, std::string_view& name);

// kSuccess, kBadPathname for a path that begins with a separator, kInvalidParameter for a name over 255
// characters or a NUL in the path.
Status checkKeyPath(std::string_view path);

// kSuccess, or kInvalidParameter for more than 16,383 characters or a NUL.
Status checkValueName(std::string_view name);

// Resolves the 32-bit view bit: inserts Wow6432Node after SOFTWARE in a path below HKEY_LOCAL_MACHINE, unless the path
// has it already.
std::string plainKeyPath(KeyHandle parent, std::string_view path, AccessMask access);

// The rights of a handle on a store without access control.
constexpr AccessMask grantedAccess(AccessMask access) {
    return (access & kKeyMaximumAllowed) == 0 ? access : access | kKeyFull;
}

// Copies a name with its NUL into a caller's buffer. kMoreData: it does not fit.
Status giveName(std::string_view name, Buffer& buffer);

// Copies data into a caller's buffer. kMoreData: they do not fit, and the buffer's size is the size needed.
Status giveData(ValueType type, std::string_view data, Buffer& buffer);

// The same for the result of a query; a text of odd size loses its last byte. `type` may be null, and is set on success
// only.
Status giveQueried(ValueType stored, std::string_view data, ValueType* type, Buffer& buffer);

}  // namespace kz7
