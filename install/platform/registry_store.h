// The registry port: a tree of keys with typed values. One operation for each platform call that the flows make; none
// prints, retries or replaces placeholders.
#pragma once

#include <cstdint>
#include <string_view>

#include "install/platform/buffer.h"
#include "install/platform/owned_handle.h"
#include "install/platform/status.h"

namespace kz7 {

// An open key, or one of the roots, which are always open.
enum class KeyHandle : std::uint64_t {
    none = 0,
    currentUser = 0x80000001,
    localMachine = 0x80000002,
    users = 0x80000003,
};

// Rights a key is opened with; the numbers are the platform's.
using AccessMask = std::uint32_t;
// clang-format off
inline constexpr AccessMask kKeyQueryValue       = 0x00001;
inline constexpr AccessMask kKeySetValue         = 0x00002;
inline constexpr AccessMask kKeyCreateSubkey     = 0x00004;
inline constexpr AccessMask kKeyEnumerateSubkeys = 0x00008;
inline constexpr AccessMask kKeyView64           = 0x00100;
inline constexpr AccessMask kKeyView32           = 0x00200;  // addresses the Wow6432Node path of the key
inline constexpr AccessMask kKeyCopyTarget       = 0x20007;
inline constexpr AccessMask kKeyRead             = 0x20019;
inline constexpr AccessMask kKeyReadSet          = 0x2001B;
inline constexpr AccessMask kKeyFull             = 0xF003F;
inline constexpr AccessMask kKeyMaximumAllowed   = 0x2000000;  // every right that the caller has on the key
inline constexpr AccessMask kKeyOpenLink         = 0x4000000;  // opens a link itself, not the key that it leads to
inline constexpr AccessMask kKeyRefuseLink       = 0x8000000;  // kAccessDenied for a link
// clang-format on

enum class ValueType : std::uint64_t {
    none = 0,
    sz = 1,
    expandSz = 2,
    binary = 3,
    dword = 4,
    multiSz = 7,
    qword = 11,
};

constexpr bool isTextType(ValueType type) {
    return type == ValueType::sz || type == ValueType::expandSz || type == ValueType::multiSz;
}

// The type of a text that ends within a UTF-16 unit; its data are the bytes of its UTF-16 form. Only a registry of
// UTF-16 texts creates such values, other stores preserve them. No registry has a type of that number.
constexpr ValueType oddText(ValueType text) {
    return ValueType{static_cast<std::uint64_t>(text) | std::uint64_t{1} << 32};
}

// The type as registries number it.
constexpr ValueType plainType(ValueType type) {
    return ValueType{static_cast<std::uint32_t>(type)};
}

inline constexpr std::uint32_t kMaxKeyName = 255;      // characters of one key name
inline constexpr std::uint32_t kMaxValueName = 16383;  // characters of a value name

// Paths are texts below a key, parts separated by backslashes; the empty path is the key itself.
// Names compare without case (ASCII), and keep their first spelling. Subkeys enumerate in the order of their
// upper-cased names, values in the order in which they were first set.
// On Windows a key may be a link to another; paths follow it unless the access for their last name says otherwise.
// Outputs are written on success only, but for Buffer::size, which kMoreData fills.
//
// Common results: kFileNotFound: no such key or value; kAccessDenied: the handle was opened without the necessary
// right; kInvalidHandle: not an open key; kKeyDeleted: the key of the handle was deleted; kInvalidParameter: a key name
// over 255 or a value name over 16,383 characters; any other number: a fault of the store itself. One thread.
class IRegistryStore {
public:
    virtual ~IRegistryStore() = default;

    // Opens an existing key. The caller closes `key`.
    virtual Status openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) = 0;

    // Opens a key, creating it and its missing parents; `keyClass` is given to a key that is created and
    // otherwise ignored. The caller closes `key`.
    virtual Status createKey(KeyHandle parent, std::string_view path, std::string_view keyClass, AccessMask access,
                             KeyHandle& key) = 0;

    // kInvalidHandle for one that is not open; closing a root does nothing.
    virtual Status closeKey(KeyHandle key) = 0;

    // Reads the type of a value, if `type` is not null, and its bytes as stored; a text of odd size loses its last
    // byte. kMoreData: `data` is too small; its size is then the size needed, and its content is undefined.
    virtual Status queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) = 0;

    // Stores exactly the bytes given. The empty name is the key's default value.
    virtual Status setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) = 0;

    virtual Status deleteValue(KeyHandle key, std::string_view name) = 0;

    // The name of the index-th subkey, NUL-terminated, and its class if `keyClass` is not null. kNoMoreItems: past the
    // last. kMoreData: the name or the class with its NUL does not fit.
    virtual Status enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) = 0;

    // The name of the index-th value, NUL-terminated, and its type and bytes if `type` and `data` are not null; all
    // bytes of a text of odd size. kNoMoreItems: past the last. kMoreData: the name with its NUL or the data do not
    // fit; the size of `data` is then the size needed.
    virtual Status enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type, Buffer* data) = 0;

    // Deletes a key and its values. kAccessDenied: it has subkeys. `view` is 0 or one of the view bits.
    // Of a link, the link itself is deleted. Open handles of the key remain; operations on them return kKeyDeleted.
    virtual Status deleteKey(KeyHandle parent, std::string_view path, AccessMask view) = 0;

    // A commit point: makes all changes since the last one visible to other programs at once. On success they are on
    // disk, on failure none of them is. Changes that are never committed may be dropped.
    virtual Status commit() = 0;
};

using OwnedKey = OwnedHandle<PortTraits<IRegistryStore, KeyHandle, &IRegistryStore::closeKey>>;

}  // namespace kz7
