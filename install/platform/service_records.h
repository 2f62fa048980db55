// The service port as records in a registry store, in the keys in which Windows keeps its services. No process is
// started for a service: its run state is a value of its record.
#pragma once

#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

#include "install/platform/file_system.h"
#include "install/platform/handle_table.h"
#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"

namespace kz7 {

// The value of a record that is the run state of its service: a number of ServiceState; none: stopped.
inline constexpr std::string_view kServiceRunState = "CurrentState";

// A value of a service's record.
struct ServiceValue {
    std::string_view name;
    ValueType type;
    std::string data;
};

// The values that a definition has in the record; with `names`, only those.
std::vector<ServiceValue> serviceValues(const ServiceDefinition& definition,
                                        std::initializer_list<std::string_view> names = {});

class ServiceRecords final : public IServiceManager {
public:
    // Writes through the registry, in its transaction.
    ServiceRecords(IRegistryStore& registry, IFileSystem& files) : registry_(registry), files_(files) {}

    Status openManager(std::uint32_t access, ServiceHandle& manager) override;
    Status createService(ServiceHandle manager, const ServiceDefinition& definition, ServiceHandle& service) override;
    Status openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                       ServiceHandle& service) override;
    Status changeStartType(ServiceHandle service, ServiceStart start) override;
    Status configureService(ServiceHandle service, const ServiceDefinition& definition) override;
    Status startService(ServiceHandle service) override;
    Status stopService(ServiceHandle service) override;
    Status waitForStop(ServiceHandle service, std::uint32_t milliseconds) override;
    Status queryState(ServiceHandle service, ServiceState& state) override;
    Status deleteService(ServiceHandle service) override;
    Status closeHandle(ServiceHandle handle) override;

    std::size_t openHandles() const { return open_.size(); }

private:
    struct Open {
        std::string recordPath;  // empty: the manager
        std::uint32_t access = 0;
        bool deleted = false;
    };

    Status managerOf(ServiceHandle handle);
    // The record of a handle that has the required rights.
    Status recordOf(ServiceHandle handle, std::uint32_t needed, OwnedKey& record);
    // The same, with the state of the service.
    Status recordOf(ServiceHandle handle, std::uint32_t needed, OwnedKey& record, ServiceState& state);
    Status deleteRecord(const std::string& path);

    IRegistryStore& registry_;
    IFileSystem& files_;
    HandleTable<ServiceHandle, Open> open_;
};

}  // namespace kz7
