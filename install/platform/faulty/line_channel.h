// A line channel whose chosen call fails.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/line_channel.h"

namespace kz7 {

class FaultyLineChannel final : public ILineChannel {
public:
    FaultyLineChannel(ILineChannel& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status readLine(Buffer& line) override {
        return unlessFailing(faults_, "readLine", [&] { return real_.readLine(line); });
    }
    void keepLineFeeds(bool on) override { real_.keepLineFeeds(on); }

private:
    ILineChannel& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
