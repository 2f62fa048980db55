#include "install/platform/windows/registry.h"

#include <windows.h>

#include <algorithm>
#include <string>

#include "install/platform/registry_path.h"
#include "install/platform/windows/wide_text.h"

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

// A call makes 32 keys at most; a path of so many names, or bytes, goes to the call in pieces.
constexpr std::size_t kCallNames = 32;
constexpr std::size_t kCallBytes = 1024;

// The last separator that leaves a path short enough for a call; 0 where all of it is, or no separator does.
std::size_t lastCut(std::string_view path) {
    std::size_t cut = 0;
    std::size_t names = 0;
    for (std::size_t at = 0; at < path.size(); ++at) {
        if (at == kCallBytes || names == kCallNames) {
            return cut;
        }
        if (path[at] == '\\') {
            cut = at;
            ++names;
        }
    }
    return 0;
}

}  // namespace

Status WindowsRegistry::shorten(KeyHandle& parent, std::string_view& path, AccessMask view, bool create,
                                OwnedKey& base) {
    if (const Status status = checkKeyPath(path); status != kSuccess) {
        return status;
    }
    for (std::size_t cut = 0; (cut = lastCut(path)) != 0;) {
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
    const Status status = statusOf(RegOpenKeyExW(native(parent), WideText(path).c_str(), 0, access, &opened));
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
    WideText named(keyClass);
    const Status status =
        statusOf(RegCreateKeyExW(native(parent), WideText(path).c_str(), 0, keyClass.empty() ? nullptr : named.data(),
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
    const WideText wide(name);
    DWORD found = 0;
    DWORD size = 0;
    const Status status = readData(
        [&] { return RegQueryValueExW(native(key), wide.c_str(), nullptr, &found, room_.data(), &size); }, size);
    return status == kSuccess ? giveValue(found, size, type, data) : status;
}

// Reads data into room of our own, whatever room was lent: only from all of a text is its size in UTF-8 known.
template <typename Call>
Status WindowsRegistry::readData(Call call, DWORD& size) {
    for (;;) {
        size = static_cast<DWORD>(room_.size());
        const Status status = statusOf(call());
        if (status != kMoreData) {
            return status;
        }
        room_.resize(std::max<std::size_t>(2 * room_.size(), size));
    }
}

Status WindowsRegistry::giveValue(std::uint32_t nativeType, std::uint32_t size, ValueType* type, Buffer& data) {
    const auto found = static_cast<ValueType>(nativeType);
    const std::string_view bytes(reinterpret_cast<const char*>(room_.data()), size);
    // Half a character at the end of a text of odd length is left out.
    const Status status =
        isTextType(found)
            ? giveData(found, textFromWide({reinterpret_cast<const wchar_t*>(bytes.data()), size / sizeof(wchar_t)}),
                       data)
            : giveData(found, bytes, data);
    if (status == kSuccess && type != nullptr) {
        *type = found;
    }
    return status;
}

Status WindowsRegistry::setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) {
    if (const Status status = checkValueName(name); status != kSuccess) {
        return status;
    }
    std::string bytes(data);
    if (isTextType(type)) {
        const std::u16string text = utf16FromText(data);
        bytes.assign(reinterpret_cast<const char*>(text.data()), text.size() * sizeof(char16_t));
    }
    const auto size = static_cast<DWORD>(bytes.size());
    // The call stores a NUL that it finds behind a text without one: here it finds none.
    bytes += "\1\1";
    return statusOf(RegSetValueExW(native(key), WideText(name).c_str(), 0, static_cast<DWORD>(type),
                                   reinterpret_cast<const BYTE*>(bytes.data()), size));
}

Status WindowsRegistry::deleteValue(KeyHandle key, std::string_view name) {
    if (const Status status = checkValueName(name); status != kSuccess) {
        return status;
    }
    return statusOf(RegDeleteValueW(native(key), WideText(name).c_str()));
}

// Names are read into room of our own: the calls do not tell how much room a lent one lacks.
Status WindowsRegistry::enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) {
    DWORD nameSize = kNameRoom;
    DWORD classSize = kNameRoom;
    const Status status = statusOf(RegEnumKeyExW(native(key), index, name_.data(), &nameSize, nullptr,
                                                 keyClass == nullptr ? nullptr : class_.data(),
                                                 keyClass == nullptr ? nullptr : &classSize, nullptr));
    if (status != kSuccess) {
        return status;
    }
    const Status named = giveName(textFromWide({name_.data(), nameSize}), name);
    const Status classed =
        keyClass == nullptr ? kSuccess : giveName(textFromWide({class_.data(), classSize}), *keyClass);
    return named != kSuccess ? named : classed;
}

Status WindowsRegistry::enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type,
                                       Buffer* data) {
    DWORD found = 0;
    DWORD nameSize = 0;
    DWORD size = 0;
    const Status read = readData(
        [&] {
            nameSize = kNameRoom;
            return RegEnumValueW(native(key), index, name_.data(), &nameSize, nullptr, &found,
                                 data == nullptr ? nullptr : room_.data(), data == nullptr ? nullptr : &size);
        },
        size);
    if (read != kSuccess) {
        return read;
    }
    ValueType given{};
    const Status status = data == nullptr ? kSuccess : giveValue(found, size, &given, *data);
    const Status named = status == kSuccess ? giveName(textFromWide({name_.data(), nameSize}), name) : status;
    if (named == kSuccess && type != nullptr) {
        *type = static_cast<ValueType>(found);
    }
    return named;
}

Status WindowsRegistry::deleteKey(KeyHandle parent, std::string_view path, AccessMask view) {
    OwnedKey base(*this);
    if (const Status status = shorten(parent, path, view, false, base); status != kSuccess) {
        return status;
    }
    const WideText named(path);
    return statusOf(view == 0 ? RegDeleteKeyW(native(parent), named.c_str())
                              : RegDeleteKeyExW(native(parent), named.c_str(), view, 0));
}

}  // namespace kz7
