// The installer session in memory: properties, and every message that was processed, as the installer would
// show it.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "install/platform/installer_session.h"

namespace kz7 {

class MemoryInstallerSession final : public IInstallerSession {
public:
    struct Message {
        std::uint32_t kind = 0;
        std::vector<std::string> fields;  // field 0 first, expanded
    };

    Status getProperty(std::string_view name, Buffer& value) override;
    Status createRecord(std::uint32_t fields, SessionHandle& record) override;
    Status setRecordString(SessionHandle record, std::uint32_t field, std::string_view text) override;
    Status processMessage(std::uint32_t kind, SessionHandle record, std::int32_t& answer) override;
    Status closeHandle(SessionHandle handle) override;

    std::map<std::string, std::string, std::less<>> properties;
    std::vector<Message> messages;
    std::int32_t answer = 0;  // what a message is answered with
    std::size_t openHandles() const { return records_.size(); }

private:
    std::string expanded(std::string_view text) const;

    std::map<SessionHandle, std::vector<std::string>> records_;
    std::uint64_t lastHandle_ = 0;
};

}  // namespace kz7
