// Key paths and names as every store understands them. The registry of Windows judges most of this itself, its
// versions differently; what is checked here is answered alike everywhere.
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

// The plain path that `path` below `parent` stands for: the 32-bit view bit leads SOFTWARE of the machine
// to its Wow6432Node, unless the path goes there already.
std::string plainKeyPath(KeyHandle parent, std::string_view path, AccessMask access);

// The rights of a handle on a store whose callers may do everything.
constexpr AccessMask grantedAccess(AccessMask access) {
    return (access & kKeyMaximumAllowed) == 0 ? access : access | kKeyFull;
}

// Gives a name to a lent buffer with its NUL: kMoreData when that does not fit.
Status giveName(std::string_view name, Buffer& buffer);

// Gives data to a lent buffer: kMoreData with the bytes needed when they do not fit.
Status giveData(ValueType type, std::string_view data, Buffer& buffer);

// The same for the answer to a query, which gets whole units of an odd text. `type` is set on success, unless null.
Status giveQueried(ValueType stored, std::string_view data, ValueType* type, Buffer& buffer);

}  // namespace kz7
