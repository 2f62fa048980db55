// An assembly cache whose chosen call fails.
#pragma once

#include "install/platform/assembly_cache.h"
#include "install/platform/faulty/fault_counter.h"

namespace kz7 {

class FaultyAssemblyCache final : public IAssemblyCache {
public:
    FaultyAssemblyCache(IAssemblyCache& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status deregisterProviders(std::string_view level) override {
        return unlessFailing(faults_, "deregisterProviders", [&] { return real_.deregisterProviders(level); });
    }
    Status registerProviders(std::string_view location, std::string_view level,
                             FrameworkGenerations generations) override {
        return unlessFailing(faults_, "registerProviders",
                             [&] { return real_.registerProviders(location, level, generations); });
    }

private:
    IAssemblyCache& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
