// The installer session that a custom action was called with.
#pragma once

#include "install/platform/installer_session.h"

namespace kz7 {

class WindowsInstallerSession final : public IInstallerSession {
public:
    // `installation` is the handle that the installer gave; it stays the installer's.
    explicit WindowsInstallerSession(std::uint32_t installation) : installation_(installation) {}

    Status runMode(RunMode mode, bool& isOn) override;
    Status getProperty(std::string_view name, Buffer& value) override;
    Status setProperty(std::string_view name, std::string_view value) override;
    Status featureState(std::string_view feature, FeatureState& installed, FeatureState& requested) override;
    Status doAction(std::string_view name) override;
    Status activeDatabase(SessionHandle& database) override;
    Status openView(SessionHandle database, std::string_view query, SessionHandle& view) override;
    Status executeView(SessionHandle view) override;
    Status fetchRecord(SessionHandle view, SessionHandle& record) override;
    Status recordString(SessionHandle record, std::uint32_t field, Buffer& text) override;
    Status createRecord(std::uint32_t fields, SessionHandle& record) override;
    Status setRecordString(SessionHandle record, std::uint32_t field, std::string_view text) override;
    Status processMessage(std::uint32_t kind, SessionHandle record, std::int32_t& answer) override;
    Status closeHandle(SessionHandle handle) override;

private:
    std::uint32_t installation_;
};

}  // namespace kz7
