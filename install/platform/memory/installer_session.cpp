#include "install/platform/memory/installer_session.h"

#include <algorithm>

#include "install/platform/registry_path.h"

namespace kz7 {

Status MemoryInstallerSession::getProperty(std::string_view name, Buffer& value) {
    const auto found = properties.find(name);
    return giveName(found == properties.end() ? std::string_view{} : found->second, value);
}

Status MemoryInstallerSession::createRecord(std::uint32_t fields, SessionHandle& record) {
    record = SessionHandle{++lastHandle_};
    records_.emplace(record, std::vector<std::string>(fields + 1));
    return kSuccess;
}

Status MemoryInstallerSession::setRecordString(SessionHandle record, std::uint32_t field, std::string_view text) {
    const auto found = records_.find(record);
    if (found == records_.end()) {
        return kInvalidHandle;
    }
    if (field >= found->second.size()) {
        return kInvalidParameter;
    }
    found->second[field] = text;
    return kSuccess;
}

Status MemoryInstallerSession::processMessage(std::uint32_t kind, SessionHandle record, std::int32_t& chosen) {
    const auto found = records_.find(record);
    if (found == records_.end()) {
        return kInvalidHandle;
    }
    Message& message = messages.emplace_back(Message{kind, {}});
    for (const std::string& field : found->second) {
        message.fields.push_back(expanded(field));
    }
    chosen = answer;
    return kSuccess;
}

Status MemoryInstallerSession::closeHandle(SessionHandle handle) {
    return records_.erase(handle) != 0 ? kSuccess : kInvalidHandle;
}

// "[Name]" is the property's value, "[\\x]" the character x, "[1]" a field and left for a reader as it is.
std::string MemoryInstallerSession::expanded(std::string_view text) const {
    std::string result;
    while (!text.empty()) {
        const std::size_t end =
            text.front() == '[' ? text.find(']', text.starts_with("[\\") ? 3 : 1) : std::string::npos;
        if (end == std::string::npos) {
            result += text.front();
            text.remove_prefix(1);
            continue;
        }
        const std::string_view name = text.substr(1, end - 1);
        if (name.starts_with('\\')) {
            result += name.substr(1);
        } else if (std::all_of(name.begin(), name.end(), [](char c) { return c >= '0' && c <= '9'; })) {
            result += text.substr(0, end + 1);
        } else if (const auto found = properties.find(name); found != properties.end()) {
            result += found->second;
        }
        text.remove_prefix(end + 1);
    }
    return result;
}

}  // namespace kz7
