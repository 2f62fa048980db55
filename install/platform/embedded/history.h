// The history port on the embedded store: tables of the store, written in the transaction of the run that they tell of.
#pragma once

#include "install/platform/embedded/descriptor.h"
#include "install/platform/embedded/registry.h"
#include "install/platform/history.h"

namespace kz7 {

class EmbeddedHistory final : public IHistory {
public:
    explicit EmbeddedHistory(EmbeddedRegistry& registry) : registry_(registry) {}

    bool isOn() override { return true; }
    Status turn(bool) override { return kCallNotImplemented; }
    void begin(const HistoryStart& run) override;
    bool takesEachChange() override { return false; }
    Status append(std::string part) override;
    Status settle(const ChangeCounts& counts) override;
    void note(std::string_view outside) override { outside_.emplace_back(outside); }
    void end(Status status) override;
    Status list(std::vector<HistoryRun>& runs) override;
    Status read(std::uint64_t number, HistoryChanges& changes) override;
    Status trim(std::uint64_t number) override;

private:
    int write(sqlite3* connection, const ChangeCounts& counts);
    std::int64_t ended() const;
    int addRun(sqlite3* connection, const ChangeCounts& counts, std::int64_t part);
    int updateRun(sqlite3* connection, const ChangeCounts& counts, bool& isThere);
    bool isLocked(std::uint64_t number);
    std::uint64_t parentOf(sqlite3* connection);

    EmbeddedRegistry& registry_;
    HistoryStart start_;
    std::int64_t begun_ = 0;
    std::vector<std::string> outside_;
    std::string part_;          // not written yet
    std::uint64_t number_ = 0;  // 0: no entry was written
    ChangeCounts counts_;
    OwnedDescriptor locks_;  // holds the lock of the run
};

}  // namespace kz7
