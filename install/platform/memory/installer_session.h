// The installer session in memory: properties, features and tables that a test sets up, and every processed message as
// the installer would show it. A scheduled action may do no more than in the installer.
#pragma once

#include <functional>
#include <map>
#include <set>
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

    struct Feature {
        FeatureState installed = FeatureState::absent;
        FeatureState requested = FeatureState::unknown;
    };

    bool isScheduled = false;
    bool isRollback = false;
    bool hasDatabase = true;
    std::map<std::string, std::string, std::less<>> properties;
    std::vector<std::string> tableRows;  // the names in the table of properties
    std::map<std::string, Feature, std::less<>> features;
    std::map<std::string, std::function<void()>, std::less<>> actions;
    std::vector<Message> messages;
    std::int32_t answer = 0;  // the answer to every message
    std::size_t openHandles() const { return records_.size() + views_.size() + databases_.size(); }

private:
    bool mayReach() const { return !isScheduled && !isRollback; }
    SessionHandle nextHandle() { return SessionHandle{++lastHandle_}; }
    std::string expanded(std::string_view text) const;

    std::map<SessionHandle, std::size_t> views_;  // the next row; beyond the last one until the view is executed
    std::set<SessionHandle> databases_;

    std::map<SessionHandle, std::vector<std::string>> records_;
    std::uint64_t lastHandle_ = 0;
};

}  // namespace kz7
