#include "install/platform/windows/registry.h"

#include <windows.h>

#include <algorithm>
#include <string>

#include "install/platform/registry_path.h"

namespace kz7 {
namespace {

bool isRoot(KeyHandle key) {
    return key == KeyHandle::currentUser || key == KeyHandle::localMachine || key == KeyHandle::users;
}

// Handles have 32 significant bits, which the system extends by their sign; so are the roots.
HKEY native(KeyHandle key) {
    return static_cast<HKEY>(LongToHandle(static_cast<LONG>(key)));
}

KeyHandle fromNative(HKEY key) {
    return static_cast<KeyHandle>(HandleToULong(key));
}

Status statusOf(LSTATUS result) {
    return static_cast<Status>(result);
}

constexpr AccessMask kViewBits = kKeyView64 | kKeyView32;

// The narrow calls put a path into a room of 261 characters for each thread; more answers kMoreData.
constexpr std::size_t kCallPath = 260;

// The last separator that leaves a path short enough for a call; it is no second half of a character.
std::size_t lastCut(std::string_view path) {
    std::size_t cut = 0;
    for (std::size_t at = 0; at <= kCallPath; at += IsDBCSLeadByte(static_cast<BYTE>(path[at])) ? 2 : 1) {
        if (path[at] == '\\') {
            cut = at;
        }
    }
    return cut;
}

// Where a call writes bytes. A buffer of no capacity still has an address: without one the call would take the
// question for the size alone and succeed.
BYTE* addressOf(Buffer& buffer) {
    static BYTE nowhere;
    return buffer.capacity == 0 ? &nowhere : reinterpret_cast<BYTE*>(buffer.data);
}

}  // namespace

Status WindowsRegistry::shorten(KeyHandle& parent, std::string_view& path, AccessMask view, bool create,
                                OwnedKey& base) {
    if (const Status status = checkKeyPath(path); status != kSuccess) {
        return status;
    }
    while (path.size() > kCallPath) {
        const std::size_t cut = lastCut(path);
        if (cut == 0) {
            return kInvalidParameter;
        }
        const std::string_view first = path.substr(0, cut);
        const AccessMask access = MAXIMUM_ALLOWED | (view & kViewBits);
        OwnedKey next(*this);
        const Status status = create ? createKey(parent, first, {}, access, next.receive())
                                     : openKey(parent, first, access, next.receive());
        if (status != kSuccess) {
            return status;
        }
        base = std::move(next);
        parent = base.get();
        path.remove_prefix(std::min(path.find_first_not_of('\\', cut), path.size()));
    }
    return kSuccess;
}

Status WindowsRegistry::openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) {
    OwnedKey base(*this);
    if (const Status status = shorten(parent, path, access, false, base); status != kSuccess) {
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
    OwnedKey base(*this);
    if (const Status status = shorten(parent, path, access, true, base); status != kSuccess) {
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
    DWORD size = data.capacity;
    const Status status =
        statusOf(RegQueryValueExA(native(key), std::string(name).c_str(), nullptr, &found, addressOf(data), &size));
    if (status == kSuccess || status == kMoreData) {
        data.size = size;
    }
    if (status == kSuccess && type != nullptr) {
        *type = static_cast<ValueType>(found);
    }
    return status;
}

Status WindowsRegistry::setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) {
    if (const Status status = checkValueName(name); status != kSuccess) {
        return status;
    }
    // The call stores a NUL that it finds behind a text without one: here it finds none.
    const std::string guarded = std::string(data) + '\1';
    return statusOf(RegSetValueExA(native(key), std::string(name).c_str(), 0, static_cast<DWORD>(type),
                                   reinterpret_cast<const BYTE*>(guarded.data()), static_cast<DWORD>(data.size())));
}

Status WindowsRegistry::deleteValue(KeyHandle key, std::string_view name) {
    if (const Status status = checkValueName(name); status != kSuccess) {
        return status;
    }
    return statusOf(RegDeleteValueA(native(key), std::string(name).c_str()));
}

// Names are read into room of our own: the calls do not tell how much room a lent one lacks.
Status WindowsRegistry::enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) {
    DWORD nameSize = kNameRoom;
    DWORD classSize = kNameRoom;
    const Status status = statusOf(RegEnumKeyExA(native(key), index, name_.data(), &nameSize, nullptr,
                                                 keyClass == nullptr ? nullptr : class_.data(),
                                                 keyClass == nullptr ? nullptr : &classSize, nullptr));
    if (status != kSuccess) {
        return status;
    }
    const Status named = giveName({name_.data(), nameSize}, name);
    const Status classed = keyClass == nullptr ? kSuccess : giveName({class_.data(), classSize}, *keyClass);
    return named != kSuccess ? named : classed;
}

Status WindowsRegistry::enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type,
                                       Buffer* data) {
    DWORD found = 0;
    DWORD nameSize = kNameRoom;
    DWORD size = data == nullptr ? 0 : data->capacity;
    const Status read =
        statusOf(RegEnumValueA(native(key), index, name_.data(), &nameSize, nullptr, &found,
                               data == nullptr ? nullptr : addressOf(*data), data == nullptr ? nullptr : &size));
    if (data != nullptr && (read == kSuccess || read == kMoreData)) {
        data->size = size;
    }
    const Status status = read == kSuccess ? giveName({name_.data(), nameSize}, name) : read;
    if (status == kSuccess && type != nullptr) {
        *type = static_cast<ValueType>(found);
    }
    return status;
}

Status WindowsRegistry::deleteKey(KeyHandle parent, std::string_view path, AccessMask view) {
    OwnedKey base(*this);
    if (const Status status = shorten(parent, path, view, false, base); status != kSuccess) {
        return status;
    }
    const std::string named(path);
    return statusOf(view == 0 ? RegDeleteKeyA(native(parent), named.c_str())
                              : RegDeleteKeyExA(native(parent), named.c_str(), view, 0));
}

}  // namespace kz7
