#include "install/src/services/management_service.h"

#include <string>

namespace kz7 {
namespace {

constexpr std::uint32_t kServiceWait = 30'000;  // milliseconds to wait for a service that stops or is being deleted

// clang-format off
constexpr ErrorText kServiceManagerFailed  {1510, "Failed open the SCM - error code %d\n"};
constexpr ErrorText kServiceOpenFailed     {1523, "Failed open the Service %s - error code %d\n", kServiceDoesNotExist};
constexpr ErrorText kStartTypeFailed       {1541, "Unable to update the start type of the service %s - error %d\n"};
constexpr ErrorText kStartFailed           {1552, "Unable to start the service %s - error %d\n"};
constexpr ErrorText kStopFailed            {1566, "Unable to stop the service %s - error %d\n", kAlways};
constexpr ErrorText kCreateManagerFailed   {1739, "Failed open the SCM - error code %d\n"};
constexpr ErrorText kCreateFailed          {1775, "Failed to create service- error code %d\n"};
constexpr ErrorText kEventLogKeyFailed     {1800, "Failed to create Event log registry key -error %d\n"};
constexpr ErrorText kMessageFileFailed     {1816, "Failed to set EventMessageFile -error %d\n"};
constexpr ErrorText kTypesFailed           {1838, "Failed to set TypesSupported -error %d\n"};

constexpr std::string_view kNotStarted =
    "The KZ7 Management service could not be started - some function not\n"
    "yet ported to the new registry layout may not function properly\n";
constexpr std::string_view kEventLogKey =
    "SYSTEM\\CurrentControlSet\\Services\\EventLog\\Application\\KZ7 Management Service";
// clang-format on

using FilePath = FixedText<261>;

// Deliberate: a location that ends in a backslash gets a second one; stored paths have always had it.
FilePath binPath(std::string_view location, std::string_view file) {
    FilePath path(location);
    path.append("\\bin\\");
    path.append(file);
    return path;
}

Status createService(IServiceManager& services, Report& report, std::string_view location, std::string_view copyName) {
    OwnedService manager(services);
    Status status = services.openManager(kServiceManagerAllAccess, manager.receive());
    if (!succeeded(status)) {
        report.error(kCreateManagerFailed, {status});
        return status;
    }
    const ServiceName name = managementServiceName(copyName);
    const FixedText<1024> displayName(compose("KZ7 Management Service (%s)", {copyName}));
    const FilePath program = managementServiceProgram(location);
    OwnedService service(services);
    // A service that was just removed may still be stopping.
    const ServiceDefinition definition{.name = name.view(),
                                       .displayName = displayName.view(),
                                       .programPath = program.view(),
                                       .deletionWait = kServiceWait};
    status = services.createService(manager.get(), definition, service.receive());
    if (!succeeded(status) && status != kServiceExists) {
        report.error(kCreateFailed, {status});
    }
    return status;
}

Status registerEventSource(IRegistryStore& registry, Report& report, std::string_view location) {
    OwnedKey key(registry);
    Status status = registry.createKey(KeyHandle::localMachine, kEventLogKey, {}, kKeyMaximumAllowed, key.receive());
    if (!succeeded(status)) {
        report.error(kEventLogKeyFailed, {status});
        return status;
    }
    std::string messageFile(binPath(location, "kz7wint64.dll").view());
    messageFile += '\0';
    status = registry.setValue(key.get(), "EventMessageFile", ValueType::expandSz, messageFile);
    if (!succeeded(status)) {
        report.error(kMessageFileFailed, {status});
        return status;
    }
    status = registry.setValue(key.get(), "TypesSupported", ValueType::dword, std::string_view("\7\0\0\0", 4));
    if (!succeeded(status)) {
        report.error(kTypesFailed, {status});
    }
    return status;
}

// Opens the service to change it and sets its start type. A failure of the second step is reported and ignored.
Status openWithStartType(IServiceManager& services, Report& report, std::string_view name, ServiceStart start,
                         OwnedService& service) {
    OwnedService manager(services);
    Status status = services.openManager(kServiceManagerAllAccess, manager.receive());
    if (!succeeded(status)) {
        report.error(kServiceManagerFailed, {status});
        return status;
    }
    status = services.openService(manager.get(), name, kServiceAllAccess, service.receive());
    if (!succeeded(status)) {
        report.error(kServiceOpenFailed, {name, status});
    } else if (const Status changed = services.changeStartType(service.get(), start); !succeeded(changed)) {
        report.error(kStartTypeFailed, {name, changed});
    }
    // Deliberate: the handles of a start or a switch-off remain open until the process ends, so that the service cannot
    // be deleted meanwhile.
    manager.leaveOpen();
    return status;
}

Status startService(IServiceManager& services, Report& report, std::string_view name) {
    OwnedService service(services);
    Status status = openWithStartType(services, report, name, ServiceStart::automatic, service);
    if (!succeeded(status)) {
        return status;
    }
    status = services.startService(service.get());
    if (status == kServiceAlreadyRunning) {
        status = kSuccess;
    }
    if (!succeeded(status)) {
        report.error(kStartFailed, {name, status});
    }
    service.leaveOpen();
    return status;
}

}  // namespace

ServiceName managementServiceName(std::string_view copyName) {
    return ServiceName(compose("KZ7MGMTSVC_%s", {copyName}));
}

FixedText<261> managementServiceProgram(std::string_view location) {
    return binPath(location, "kz7mgmtsvc.exe");
}

Status registerManagementService(IRegistryStore& registry, IServiceManager& services, Report& report,
                                 std::string_view location, std::string_view copyName, bool start) {
    Status status = createService(services, report, location, copyName);
    // Deliberate: an existing service is not changed, and neither are its event source and its state; another run does
    // not repair it.
    if (status == kServiceExists) {
        return kSuccess;
    }
    if (succeeded(status)) {
        status = registerEventSource(registry, report, location);
    }
    if (succeeded(status) && start) {
        status = startService(services, report, managementServiceName(copyName).view());
        if (!succeeded(status)) {
            report.line(kNotStarted);
        }
    }
    return status;
}

void switchOffService(IServiceManager& services, Report& report, std::string_view name) {
    OwnedService service(services);
    if (!succeeded(openWithStartType(services, report, name, ServiceStart::demand, service))) {
        return;
    }
    // Deliberate: the result of the stop is inverted: a stop that succeeds is reported as error 1, one that fails is
    // not reported. All existing logs have it so.
    if (succeeded(services.stopService(service.get()))) {
        report.error(kStopFailed, {name, std::uint32_t{1}});
    }
    service.leaveOpen();
}

Status deleteServiceByName(IServiceManager& services, std::string_view name) {
    OwnedService manager(services);
    OwnedService service(services);
    Status status = services.openManager(kServiceManagerAllAccess, manager.receive());
    if (succeeded(status)) {
        status = services.openService(manager.get(), name, kServiceAllAccess, service.receive());
    }
    if (!succeeded(status)) {
        return status == kServiceDoesNotExist ? kSuccess : status;
    }
    // A service that still runs could not be created again. It is deleted even if it does not run or cannot be stopped.
    const Status stopped = services.stopService(service.get());
    if (stopped == kSuccess || stopped == kServiceTakesNoControl) {
        services.waitForStop(service.get(), kServiceWait);
    }
    return services.deleteService(service.get());
}

}  // namespace kz7
