// The service port in memory. Programs are those of a file system; none is started, a service just has its
// run state. As with the machine's own manager, a deleted service keeps its name until its handles are closed.
#pragma once

#include <map>
#include <memory>
#include <string>

#include "install/platform/file_system.h"
#include "install/platform/service_manager.h"

namespace kz7 {

class MemoryServiceManager final : public IServiceManager {
public:
    struct Service {
        std::string name;
        std::string displayName;
        std::string programPath;
        std::uint32_t type = kServiceOwnProcess;
        ServiceStart start = ServiceStart::automatic;
        std::uint32_t errorControl = kServiceErrorNormal;
        ServiceState state = ServiceState::stopped;
        bool deleted = false;
    };

    explicit MemoryServiceManager(IFileSystem& files);

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

    // Null where there is none.
    const Service* find(std::string_view name) const;
    std::size_t count() const { return services_.size(); }

    // Handles given out and not closed yet.
    std::size_t openHandles() const { return open_.size(); }

private:
    struct Open {
        std::shared_ptr<Service> service;  // null: the manager
        std::uint32_t access;
    };

    ServiceHandle giveOut(std::shared_ptr<Service> service, std::uint32_t access);
    Status managerOf(ServiceHandle handle) const;
    Status serviceOf(ServiceHandle handle, std::uint32_t needed, std::shared_ptr<Service>& service) const;

    IFileSystem& files_;
    std::map<std::string, std::shared_ptr<Service>, std::less<>> services_;  // by folded name
    std::map<ServiceHandle, Open> open_;
    std::uint64_t lastHandle_ = 0;
};

}  // namespace kz7
