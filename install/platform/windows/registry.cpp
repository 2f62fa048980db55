#include "install/platform/windows/registry.h"

#include <windows.h>

#include <string>

#include "install/platform/registry_path.h"

namespace kz7 {
namespace {

bool isRoot(KeyHandle key) {
    return key == KeyHandle::currentUser || key == KeyHandle::localMachine || key == KeyHandle::users;
}

HKEY native(KeyHandle key) {
    const auto number = static_cast<std::uint64_t>(key);
    // The roots are 32-bit numbers that the system extends by their sign.
    const auto extended = isRoot(key) ? static_cast<std::uint64_t>(static_cast<std::int32_t>(number)) : number;
    return reinterpret_cast<HKEY>(extended);
}

KeyHandle fromNative(HKEY key) {
    return static_cast<KeyHandle>(reinterpret_cast<std::uint64_t>(key));
}

Status statusOf(LSTATUS result) {
    return static_cast<Status>(result);
}

// What a call needs to know of a lent buffer. One of no capacity still has an address: without one the call
// would take the question for the size alone and succeed.
struct LentBuffer {
    explicit LentBuffer(Buffer& buffer) : lent(buffer), size(buffer.capacity) {}

    char* address() { return lent.capacity == 0 ? &nowhere : lent.data; }

    // Keeps the size that a call gave; one that did not fit is never shown as filled, also where the call does
    // not tell what it needs.
    Status keep(Status status) {
        if (status == kSuccess) {
            lent.size = size;
        } else if (status == kMoreData) {
            lent.size = size > lent.capacity ? size : lent.capacity + 1;
        }
        return status;
    }

    Buffer& lent;
    DWORD size;
    char nowhere = 0;
};

}  // namespace

Status WindowsRegistry::openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) {
    if (const Status status = checkKeyPath(path); status != kSuccess) {
        return status;
    }
    HKEY opened = nullptr;
    const Status status = statusOf(RegOpenKeyExA(native(parent), std::string(path).c_str(), 0, access, &opened));
    if (status == kSuccess) {
        key = fromNative(opened);
    }
    return status;
}

Status WindowsRegistry::createKey(KeyHandle parent, std::string_view path, std::string_view keyClass, AccessMask access,
                                  KeyHandle& key) {
    if (const Status status = checkKeyPath(path); status != kSuccess) {
        return status;
    }
    HKEY made = nullptr;
    std::string named(keyClass);
    const Status status =
        statusOf(RegCreateKeyExA(native(parent), std::string(path).c_str(), 0, named.empty() ? nullptr : named.data(),
                                 REG_OPTION_NON_VOLATILE, access, nullptr, &made, nullptr));
    if (status == kSuccess) {
        key = fromNative(made);
    }
    return status;
}

Status WindowsRegistry::closeKey(KeyHandle key) {
    return isRoot(key) ? kSuccess : statusOf(RegCloseKey(native(key)));
}

Status WindowsRegistry::queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) {
    if (const Status status = checkValueName(name); status != kSuccess) {
        return status;
    }
    DWORD found = 0;
    LentBuffer lent(data);
    const Status status = lent.keep(statusOf(RegQueryValueExA(native(key), std::string(name).c_str(), nullptr, &found,
                                                              reinterpret_cast<BYTE*>(lent.address()), &lent.size)));
    if (status == kSuccess && type != nullptr) {
        *type = static_cast<ValueType>(found);
    }
    return status;
}

Status WindowsRegistry::setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) {
    if (const Status status = checkValueName(name); status != kSuccess) {
        return status;
    }
    const char none = 0;
    return statusOf(RegSetValueExA(native(key), std::string(name).c_str(), 0, static_cast<DWORD>(type),
                                   reinterpret_cast<const BYTE*>(data.empty() ? &none : data.data()),
                                   static_cast<DWORD>(data.size())));
}

Status WindowsRegistry::deleteValue(KeyHandle key, std::string_view name) {
    if (const Status status = checkValueName(name); status != kSuccess) {
        return status;
    }
    return statusOf(RegDeleteValueA(native(key), std::string(name).c_str()));
}

Status WindowsRegistry::enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) {
    LentBuffer lent(name);
    Buffer unused(nullptr, 0);
    LentBuffer classified(keyClass == nullptr ? unused : *keyClass);
    const Status status = statusOf(RegEnumKeyExA(native(key), index, lent.address(), &lent.size, nullptr,
                                                 keyClass == nullptr ? nullptr : classified.address(),
                                                 keyClass == nullptr ? nullptr : &classified.size, nullptr));
    classified.keep(status);
    return lent.keep(status);
}

Status WindowsRegistry::enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type,
                                       Buffer* data) {
    DWORD found = 0;
    LentBuffer lent(name);
    Buffer unused(nullptr, 0);
    LentBuffer bytes(data == nullptr ? unused : *data);
    const Status status = statusOf(RegEnumValueA(native(key), index, lent.address(), &lent.size, nullptr, &found,
                                                 data == nullptr ? nullptr : reinterpret_cast<BYTE*>(bytes.address()),
                                                 data == nullptr ? nullptr : &bytes.size));
    bytes.keep(status);
    if (status == kSuccess && type != nullptr) {
        *type = static_cast<ValueType>(found);
    }
    return lent.keep(status);
}

Status WindowsRegistry::deleteKey(KeyHandle parent, std::string_view path, AccessMask view) {
    if (const Status status = checkKeyPath(path); status != kSuccess) {
        return status;
    }
    return statusOf(RegDeleteKeyExA(native(parent), std::string(path).c_str(), view, 0));
}

}  // namespace kz7
