// A service manager whose chosen call fails.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/service_manager.h"

namespace kz7 {

class FaultyServiceManager final : public IServiceManager {
public:
    FaultyServiceManager(IServiceManager& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status openManager(std::uint32_t access, ServiceHandle& manager) override {
        return unlessFailing(faults_, "openManager", [&] { return real_.openManager(access, manager); });
    }
    Status createService(ServiceHandle manager, const ServiceDefinition& definition, ServiceHandle& service) override {
        return unlessFailing(faults_, "createService",
                             [&] { return real_.createService(manager, definition, service); });
    }
    Status openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                       ServiceHandle& service) override {
        return unlessFailing(faults_, "openService", [&] { return real_.openService(manager, name, access, service); });
    }
    Status changeStartType(ServiceHandle service, ServiceStart start) override {
        return unlessFailing(faults_, "changeStartType", [&] { return real_.changeStartType(service, start); });
    }
    Status startService(ServiceHandle service) override {
        return unlessFailing(faults_, "startService", [&] { return real_.startService(service); });
    }
    Status stopService(ServiceHandle service) override {
        return unlessFailing(faults_, "stopService", [&] { return real_.stopService(service); });
    }
    Status queryState(ServiceHandle service, ServiceState& state) override {
        return unlessFailing(faults_, "queryState", [&] { return real_.queryState(service, state); });
    }
    Status deleteService(ServiceHandle service) override {
        return unlessFailing(faults_, "deleteService", [&] { return real_.deleteService(service); });
    }
    Status closeHandle(ServiceHandle handle) override {
        return closingAnyway(faults_, "closeHandle", [&] { return real_.closeHandle(handle); });
    }

private:
    IServiceManager& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
