// A machine whose chosen answer about itself fails.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/host_identity.h"

namespace kz7 {

class FaultyHostIdentity final : public IHostIdentity {
public:
    FaultyHostIdentity(IHostIdentity& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status operatingSystem(std::string& name, std::string& version) override {
        return unlessFailing(faults_, "operatingSystem", [&] { return real_.operatingSystem(name, version); });
    }

private:
    IHostIdentity& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
