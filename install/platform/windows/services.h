// The service port on the Windows service manager.
#pragma once

#include "install/platform/service_manager.h"

namespace kz7 {

class WindowsServiceManager final : public IServiceManager {
public:
    Status openManager(std::uint32_t access, ServiceHandle& manager) override;
    Status createService(ServiceHandle manager, const ServiceDefinition& definition, ServiceHandle& service) override;
    Status openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                       ServiceHandle& service) override;
    Status changeStartType(ServiceHandle service, ServiceStart start) override;
    Status startService(ServiceHandle service) override;
    Status stopService(ServiceHandle service) override;
    Status queryState(ServiceHandle service, ServiceState& state) override;
    Status deleteService(ServiceHandle service) override;
    Status closeHandle(ServiceHandle handle) override;
};

}  // namespace kz7
