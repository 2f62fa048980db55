#include "install/platform/memory/installer_session.h"

#include <algorithm>

#include "install/platform/registry_path.h"

namespace kz7 {

namespace {

constexpr std::string_view kPropertyQuery = "SELECT `Property` FROM `Property` ORDER BY `Property`";
constexpr std::size_t kBeforeExecution = static_cast<std::size_t>(-1);

// Copies a text with its NUL if it fits; otherwise the size is the text's size times a factor.
Status giveText(std::string_view text, Buffer& room, std::uint32_t hintFactor) {
    const auto length = static_cast<std::uint32_t>(text.size());
    const Status status = giveName(text, room);
    room.size = status == kMoreData ? length * hintFactor : length;
    return status;
}

}  // namespace

Status MemoryInstallerSession::runMode(RunMode mode, bool& isOn) {
    isOn = mode == RunMode::rollback ? isRollback : isScheduled;
    return kSuccess;
}

Status MemoryInstallerSession::getProperty(std::string_view name, Buffer& value) {
    const auto found = properties.find(name);
    const bool readable = mayReach() || std::find(kReadableWhenScheduled.begin(), kReadableWhenScheduled.end(), name) !=
                                            kReadableWhenScheduled.end();
    // The installer reports twice the size of a text that does not fit.
    return giveText(found == properties.end() || !readable ? std::string_view{} : found->second, value, 2);
}

Status MemoryInstallerSession::setProperty(std::string_view name, std::string_view value) {
    if (!mayReach()) {
        return kFunctionFailed;
    }
    if (value.empty()) {
        properties.erase(std::string(name));
    } else {
        properties.insert_or_assign(std::string(name), std::string(value));
    }
    return kSuccess;
}

Status MemoryInstallerSession::featureState(std::string_view feature, FeatureState& installed,
                                            FeatureState& requested) {
    const auto found = features.find(feature);
    if (!mayReach() || found == features.end()) {
        return mayReach() ? kUnknownFeature : kInvalidHandle;
    }
    installed = found->second.installed;
    requested = found->second.requested;
    return kSuccess;
}

Status MemoryInstallerSession::doAction(std::string_view name) {
    const auto found = actions.find(name);
    if (!mayReach() || found == actions.end()) {
        return mayReach() ? kActionNotCalled : kInvalidHandle;
    }
    found->second();
    return kSuccess;
}

Status MemoryInstallerSession::activeDatabase(SessionHandle& database) {
    if (!mayReach() || !hasDatabase) {
        return kInvalidHandle;
    }
    database = *databases_.insert(nextHandle()).first;
    return kSuccess;
}

Status MemoryInstallerSession::openView(SessionHandle database, std::string_view query, SessionHandle& view) {
    if (!databases_.contains(database)) {
        return kInvalidHandle;
    }
    if (query != kPropertyQuery) {
        return kBadQuery;
    }
    view = nextHandle();
    views_.emplace(view, kBeforeExecution);
    return kSuccess;
}

Status MemoryInstallerSession::executeView(SessionHandle view) {
    const auto found = views_.find(view);
    if (found == views_.end()) {
        return kInvalidHandle;
    }
    found->second = 0;
    return kSuccess;
}

Status MemoryInstallerSession::fetchRecord(SessionHandle view, SessionHandle& record) {
    const auto found = views_.find(view);
    if (found == views_.end()) {
        return kInvalidHandle;
    }
    if (found->second >= tableRows.size()) {
        return found->second == kBeforeExecution ? kFunctionFailed : kNoMoreItems;
    }
    record = nextHandle();
    records_.emplace(record, std::vector<std::string>{std::string{}, tableRows[found->second++]});
    return kSuccess;
}

Status MemoryInstallerSession::recordString(SessionHandle record, std::uint32_t field, Buffer& text) {
    const auto found = records_.find(record);
    if (found == records_.end()) {
        return kInvalidHandle;
    }
    return giveText(field < found->second.size() ? std::string_view(found->second[field]) : std::string_view{}, text,
                    1);
}

Status MemoryInstallerSession::createRecord(std::uint32_t fields, SessionHandle& record) {
    record = nextHandle();
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
    return records_.erase(handle) + views_.erase(handle) + databases_.erase(handle) != 0 ? kSuccess : kInvalidHandle;
}

// "[Name]" is replaced by the property's value and "[\\x]" by the character x; "[1]" is a field and remains.
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
