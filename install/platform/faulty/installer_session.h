// An installer session whose chosen call fails.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/installer_session.h"

namespace kz7 {

class FaultyInstallerSession final : public IInstallerSession {
public:
    FaultyInstallerSession(IInstallerSession& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status getProperty(std::string_view name, Buffer& value) override {
        return unlessFailing(faults_, "getProperty", [&] { return real_.getProperty(name, value); });
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
