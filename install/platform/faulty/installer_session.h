// An installer session whose chosen call fails.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/installer_session.h"

namespace kz7 {

class FaultyInstallerSession final : public IInstallerSession {
public:
    FaultyInstallerSession(IInstallerSession& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status runMode(RunMode mode, bool& isOn) override {
        return unlessFailing(faults_, "runMode", [&] { return real_.runMode(mode, isOn); });
    }
    Status getProperty(std::string_view name, Buffer& value) override {
        return unlessFailing(faults_, "getProperty", [&] { return real_.getProperty(name, value); });
    }
    Status setProperty(std::string_view name, std::string_view value) override {
        return unlessFailing(faults_, "setProperty", [&] { return real_.setProperty(name, value); });
    }
    Status featureState(std::string_view feature, FeatureState& installed, FeatureState& requested) override {
        return unlessFailing(faults_, "featureState",
                             [&] { return real_.featureState(feature, installed, requested); });
    }
    Status doAction(std::string_view name) override {
        return unlessFailing(faults_, "doAction", [&] { return real_.doAction(name); });
    }
    Status activeDatabase(SessionHandle& database) override {
        return unlessFailing(faults_, "activeDatabase", [&] { return real_.activeDatabase(database); });
    }
    Status openView(SessionHandle database, std::string_view query, SessionHandle& view) override {
        return unlessFailing(faults_, "openView", [&] { return real_.openView(database, query, view); });
    }
    Status executeView(SessionHandle view) override {
        return unlessFailing(faults_, "executeView", [&] { return real_.executeView(view); });
    }
    Status fetchRecord(SessionHandle view, SessionHandle& record) override {
        return unlessFailing(faults_, "fetchRecord", [&] { return real_.fetchRecord(view, record); });
    }
    Status recordString(SessionHandle record, std::uint32_t field, Buffer& text) override {
        return unlessFailing(faults_, "recordString", [&] { return real_.recordString(record, field, text); });
    }
    Status createRecord(std::uint32_t fields, SessionHandle& record) override {
        return unlessFailing(faults_, "createRecord", [&] { return real_.createRecord(fields, record); });
    }
    Status setRecordString(SessionHandle record, std::uint32_t field, std::string_view text) override {
        return unlessFailing(faults_, "setRecordString", [&] { return real_.setRecordString(record, field, text); });
    }
    Status processMessage(std::uint32_t kind, SessionHandle record, std::int32_t& answer) override {
        return unlessFailing(faults_, "processMessage", [&] { return real_.processMessage(kind, record, answer); });
    }
    Status closeHandle(SessionHandle handle) override {
        return closingAnyway(faults_, "closeHandle", [&] { return real_.closeHandle(handle); });
    }

private:
    IInstallerSession& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
