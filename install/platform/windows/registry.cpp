#include "install/platform/windows/ports.h"

#include <windows.h>
#include <winternl.h>

#include <algorithm>
#include <array>
#include <string>
#include <vector>

#include "install/platform/registry_path.h"
#include "install/platform/windows/change_lock.h"
#include "install/platform/windows/wide_text.h"

extern "C" NTSTATUS NTAPI NtDeleteKey(HANDLE key);
extern "C" NTSTATUS NTAPI NtCreateKey(HANDLE* key, ACCESS_MASK access, OBJECT_ATTRIBUTES* attributes, ULONG titleIndex,
                                      UNICODE_STRING* keyClass, ULONG options, ULONG* disposition);

namespace kz7 {
namespace {

// Whether an open key is a link; it was opened with REG_OPTION_OPEN_LINK.
bool isLink(HKEY key) {
    DWORD type = 0;
    return RegQueryValueExW(key, L"SymbolicLinkValue", nullptr, &type, nullptr, nullptr) == ERROR_SUCCESS &&
           type == REG_LINK;
}

bool isRoot(KeyHandle key) {
    return key == KeyHandle::currentUser || key == KeyHandle::localMachine || key == KeyHandle::users;
}

// Handles have 32 significant bits and are sign-extended to 64, like the predefined roots.
HKEY native(KeyHandle key) {
    return static_cast<HKEY>(LongToHandle(static_cast<LONG>(key)));
}

KeyHandle fromNative(HKEY key) {
    return static_cast<KeyHandle>(HandleToULong(key));
}

Status statusOf(LSTATUS result) {
    return static_cast<Status>(result);
}

constexpr AccessMask kLinkBits = kKeyOpenLink | kKeyRefuseLink;
constexpr AccessMask kViewBits = kKeyView64 | kKeyView32;

// One call creates at most 32 keys. Longer paths are passed in pieces.
constexpr std::size_t kCallNames = 32;
constexpr std::size_t kCallBytes = 1024;

// The separator before which a path fits a call; 0 if all of it fits, or if none does.
std::size_t placeForCall(std::string_view path) {
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

// The separator at which a path is cut for a call; 0 if it is passed whole.
std::size_t cutOf(std::string_view path, bool lastNameAlone) {
    const std::size_t cut = placeForCall(path);
    const std::size_t last = cut != 0 || !lastNameAlone ? std::string_view::npos : path.find_last_of('\\');
    return last == std::string_view::npos ? cut : last;
}

UNICODE_STRING unicodeString(WideText& text) {
    const auto bytes = static_cast<USHORT>(text.size() * sizeof(wchar_t));
    return {bytes, static_cast<USHORT>(bytes + sizeof(wchar_t)), text.data()};
}

// Creates a key below another, or opens an existing one. A link of that name is opened itself: RegCreateKeyEx() would
// follow a link that another program creates after a check.
LSTATUS createBelow(HKEY parent, WideText name, WideText keyClass, AccessMask access, HKEY& key) {
    UNICODE_STRING named = unicodeString(name);
    UNICODE_STRING classed = unicodeString(keyClass);
    OBJECT_ATTRIBUTES attributes{};
    InitializeObjectAttributes(&attributes, &named, OBJ_CASE_INSENSITIVE | OBJ_OPENLINK, parent, nullptr);
    HANDLE made = nullptr;
    const NTSTATUS status = NtCreateKey(&made, access, &attributes, 0, classed.Length == 0 ? nullptr : &classed,
                                        REG_OPTION_NON_VOLATILE, nullptr);
    key = static_cast<HKEY>(made);
    return static_cast<LSTATUS>(RtlNtStatusToDosError(status));
}

// Names and the data of text types are UTF-16 in the registry.
class WindowsRegistry final : public IRegistryStore {
public:
    explicit WindowsRegistry(ChangeLock& lock) : lock_(lock) {}

    Status openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) override {
        OwnedKey base(*this);
        if (const Status status = shorten(parent, path, access, false, base); status != kSuccess) {
            return status;
        }
        HKEY opened = nullptr;
        const Status status =
            statusOf(RegOpenKeyExW(native(parent), WideText(path).c_str(),
                                   (access & kLinkBits) != 0 ? REG_OPTION_OPEN_LINK : 0, access & ~kLinkBits, &opened));
        return status == kSuccess ? give(opened, access, key) : status;
    }

    Status createKey(KeyHandle parent, std::string_view path, std::string_view keyClass, AccessMask access,
                     KeyHandle& key) override {
        OwnedKey base(*this);
        if (const Status status = shorten(parent, path, access, true, base); status != kSuccess) {
            return status;
        }
        HKEY made = nullptr;
        WideText named(keyClass);
        const Status status = statusOf(
            base && (access & kKeyRefuseLink) != 0
                ? createBelow(native(parent), WideText(path), named, access & ~kLinkBits, made)
                : RegCreateKeyExW(native(parent), WideText(path).c_str(), 0, keyClass.empty() ? nullptr : named.data(),
                                  REG_OPTION_NON_VOLATILE, access, nullptr, &made, nullptr));
        return status == kSuccess ? give(made, access, key) : status;
    }

    Status closeKey(KeyHandle key) override { return isRoot(key) ? kSuccess : statusOf(RegCloseKey(native(key))); }

    Status queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) override {
        if (const Status status = checkValueName(name); status != kSuccess) {
            return status;
        }
        const WideText wide(name);
        DWORD found = 0;
        DWORD size = 0;
        const Status status = readData(
            [&] { return RegQueryValueExW(native(key), wide.c_str(), nullptr, &found, room_.data(), &size); }, size);
        return status == kSuccess ? giveValue(ValueType{found}, size, type, data) : status;
    }

    Status setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) override {
        if (const Status status = checkValueName(name); status != kSuccess) {
            return status;
        }
        std::string bytes(data);
        if (isTextType(type)) {
            const std::u16string text = utf16FromText(data);
            bytes.assign(reinterpret_cast<const char*>(text.data()), text.size() * sizeof(char16_t));
        }
        const auto size = static_cast<DWORD>(bytes.size());
        // RegSetValueEx() also stores a NUL that follows a text without one. These bytes keep it from finding one.
        bytes += "\1\1";
        return statusOf(RegSetValueExW(native(key), WideText(name).c_str(), 0, static_cast<DWORD>(type),
                                       reinterpret_cast<const BYTE*>(bytes.data()), size));
    }

    Status deleteValue(KeyHandle key, std::string_view name) override {
        if (const Status status = checkValueName(name); status != kSuccess) {
            return status;
        }
        return statusOf(RegDeleteValueW(native(key), WideText(name).c_str()));
    }

    // Reads names into buffers of its own: the call does not return the size of one that does not fit.
    Status enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) override {
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

    Status enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type, Buffer* data) override {
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
        ValueType given{found};
        const bool isOdd = data != nullptr && isTextType(given) && size % sizeof(wchar_t) != 0;
        const Status status =
            data == nullptr ? kSuccess : giveValue(isOdd ? oddText(given) : given, size, &given, *data);
        const Status named = status == kSuccess ? giveName(textFromWide({name_.data(), nameSize}), name) : status;
        if (named == kSuccess && type != nullptr) {
            *type = given;
        }
        return named;
    }

    Status deleteKey(KeyHandle parent, std::string_view path, AccessMask view) override {
        // The usual call would follow a link and delete its target.
        OwnedKey key(*this);
        const Status status = openKey(parent, path, DELETE | kKeyOpenLink | (view & kViewBits), key.receive());
        return status == kSuccess ? RtlNtStatusToDosError(NtDeleteKey(native(key.get()))) : status;
    }

    // Every change is visible at once; only the lock is released.
    Status commit() override { return lock_.release(); }

private:
    // The handle of a key, or kAccessDenied for a link that is refused.
    Status give(HKEY opened, AccessMask access, KeyHandle& key) {
        if ((access & kKeyRefuseLink) != 0 && isLink(opened)) {
            RegCloseKey(opened);
            return kAccessDenied;
        }
        key = fromNative(opened);
        return kSuccess;
    }

    // Opens the first part of a path that is too long for one call, or all but its last name if that must not be a
    // link. `parent` and `path` become the key and the rest; `base` owns the key.
    Status shorten(KeyHandle& parent, std::string_view& path, AccessMask access, bool create, OwnedKey& base) {
        Status status = lock_.hold();
        if (status == kSuccess) {
            status = checkKeyPath(path);
        }
        path = path.substr(0, path.find_last_not_of('\\') + 1);
        std::size_t cut = 0;
        while (status == kSuccess && (cut = cutOf(path, create && (access & kKeyRefuseLink) != 0)) != 0) {
            const std::string_view first = path.substr(0, cut);
            const AccessMask way = MAXIMUM_ALLOWED | (access & kViewBits);
            OwnedKey next(*this);
            status = create ? createKey(parent, first, {}, way, next.receive())
                            : openKey(parent, first, way, next.receive());
            if (status == kSuccess) {
                base = std::move(next);
                parent = base.get();
                path.remove_prefix(std::min(path.find_first_not_of('\\', cut), path.size()));
            }
        }
        return status;
    }

    // Reads data into a buffer of its own: the size of a text in UTF-8 is known only from all of it.
    template <typename Call>
    Status readData(Call call, DWORD& size) {
        for (;;) {
            size = static_cast<DWORD>(room_.size());
            const Status status = statusOf(call());
            if (status != kMoreData) {
                return status;
            }
            room_.resize(std::max<std::size_t>(2 * room_.size(), size));
        }
    }

    // Drops half a unit at the end of a text.
    Status giveValue(ValueType found, std::uint32_t size, ValueType* type, Buffer& data) {
        const std::string_view bytes(reinterpret_cast<const char*>(room_.data()), size);
        const Status status = giveData(
            found,
            isTextType(found) ? textFromWide({reinterpret_cast<const wchar_t*>(room_.data()), size / sizeof(wchar_t)})
                              : bytes,
            data);
        if (status == kSuccess && type != nullptr) {
            *type = found;
        }
        return status;
    }

    static constexpr std::uint32_t kNameRoom = 32767;  // characters
    static constexpr std::size_t kFirstRoom = 4096;    // bytes
    ChangeLock& lock_;
    std::array<wchar_t, kNameRoom> name_;
    std::array<wchar_t, kNameRoom> class_;
    std::vector<unsigned char> room_ = std::vector<unsigned char>(kFirstRoom);
};

}  // namespace

std::unique_ptr<IRegistryStore> windowsRegistry(ChangeLock& lock) {
    return std::make_unique<WindowsRegistry>(lock);
}

}  // namespace kz7
