#include "install/platform/registry_path.h"

#include "install/platform/encoding.h"
#include "install/platform/text.h"

namespace kz7 {

bool takeName(std::string_view& path, std::string_view& name) {
    const std::size_t begin = path.find_first_not_of('\\');
    if (begin == std::string_view::npos) {
        path = {};
        return false;
    }
    path.remove_prefix(begin);
    name = path.substr(0, path.find('\\'));
    path.remove_prefix(name.size());
    return true;
}

Status checkKeyPath(std::string_view path) {
    if (!path.empty() && path.front() == '\\') {
        return kBadPathname;
    }
    if (path.find('\0') != std::string_view::npos) {
        return kInvalidParameter;
    }
    std::string_view name;
    while (takeName(path, name)) {
        if (!fitsCharacters(name, kMaxKeyName)) {
            return kInvalidParameter;
        }
    }
    return kSuccess;
}

Status checkValueName(std::string_view name) {
    return !fitsCharacters(name, kMaxValueName) || name.find('\0') != std::string_view::npos ? kInvalidParameter
                                                                                             : kSuccess;
}

std::string plainKeyPath(KeyHandle parent, std::string_view path, AccessMask access) {
    std::string plain(path);
    if ((access & kKeyView32) == 0 || parent != KeyHandle::localMachine) {
        return plain;
    }
    std::string_view rest = path;
    std::string_view name;
    if (!takeName(rest, name) || !equalsIgnoreCase(name, "SOFTWARE")) {
        return plain;
    }
    const std::size_t below = plain.size() - rest.size();
    if (takeName(rest, name) && equalsIgnoreCase(name, "Wow6432Node")) {
        return plain;
    }
    return plain.insert(below, "\\Wow6432Node");
}

Status giveName(std::string_view name, Buffer& buffer) {
    buffer.refused = name.size() >= buffer.capacity || !fitsCharacters(name, buffer.limit - 1);
    if (buffer.refused) {
        buffer.size = static_cast<std::uint32_t>(name.size() + 1);
        return kMoreData;
    }
    name.copy(buffer.data, name.size());
    buffer.data[name.size()] = '\0';
    buffer.size = static_cast<std::uint32_t>(name.size());
    return kSuccess;
}

Status giveData(ValueType type, std::string_view data, Buffer& buffer) {
    buffer.size = static_cast<std::uint32_t>(data.size());
    buffer.refused = data.size() > buffer.capacity ||
                     !(isTextType(type) ? fitsCharacters(data, buffer.limit) : data.size() <= buffer.limit);
    if (buffer.refused) {
        return kMoreData;
    }
    data.copy(buffer.data, data.size());
    return kSuccess;
}

Status giveQueried(ValueType stored, std::string_view data, ValueType* type, Buffer& buffer) {
    const ValueType plain = plainType(stored);
    const Status status = giveData(plain, plain == stored ? data : textFromUtf16(utf16FromBytes(data)), buffer);
    if (status == kSuccess && type != nullptr) {
        *type = plain;
    }
    return status;
}

}  // namespace kz7
