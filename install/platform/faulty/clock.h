// A clock whose chosen call fails.
#pragma once

#include "install/platform/clock.h"
#include "install/platform/faulty/fault_counter.h"

namespace kz7 {

class FaultyClock final : public IClock {
public:
    FaultyClock(IClock& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status localTime(TimeText form, Buffer& text) override {
        return unlessFailing(faults_, "localTime", [&] { return real_.localTime(form, text); });
    }

private:
    IClock& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
