// The service port: the machine's service manager, one operation for each call that can fail on its own.
#pragma once

#include <cstdint>
#include <string_view>

#include "install/platform/owned_handle.h"
#include "install/platform/registry_store.h"
#include "install/platform/status.h"
#include "install/platform/text.h"

namespace kz7 {

// The manager or one service; closeHandle() closes both.
enum class ServiceHandle : std::uint64_t { none = 0 };

inline constexpr std::uint32_t kServiceManagerConnect = 0x0001;
inline constexpr std::uint32_t kServiceManagerAllAccess = 0xF003F;
inline constexpr std::uint32_t kServiceAllAccess = 0xF01FF;
inline constexpr std::uint32_t kServiceChangeConfig = 0x0002;
inline constexpr std::uint32_t kServiceQueryStatus = 0x0004;
inline constexpr std::uint32_t kServiceStartRight = 0x0010;
inline constexpr std::uint32_t kServiceStop = 0x0020;
inline constexpr std::uint32_t kServiceDelete = 0x10000;

inline constexpr std::uint32_t kServiceOwnProcess = 0x10;
inline constexpr std::uint32_t kServiceErrorNormal = 1;

enum class ServiceStart : std::uint32_t { automatic = 2, demand = 3, disabled = 4 };

enum class ServiceState : std::uint32_t {
    stopped = 1,
    startPending = 2,
    stopPending = 3,
    running = 4,
};

// The key of each service is below this key of HKEY_LOCAL_MACHINE.
inline constexpr std::string_view kServiceKeys = "SYSTEM\\CurrentControlSet\\Services\\";

// Characters of a service's name: the name is a key's.
inline constexpr std::size_t kMaxServiceName = kMaxKeyName;

inline bool isServiceName(std::string_view name) {
    return !name.empty() && fitsCharacters(name, kMaxServiceName) &&
           name.find_first_of("/\\") == std::string_view::npos;
}

// A service that runs as LocalSystem in a process of its own, without load order group or dependencies.
struct ServiceDefinition {
    std::string_view name;
    std::string_view displayName;
    std::string_view programPath;  // stored unchanged, without quotation marks
    std::uint32_t type = kServiceOwnProcess;
    ServiceStart start = ServiceStart::automatic;
    std::uint32_t errorControl = kServiceErrorNormal;
    std::uint32_t deletionWait = 0;  // milliseconds that a pending deletion of that name is waited for
};

// The caller closes every handle that it gets. Outputs are written on success only. Service names
// compare without case (ASCII). Common results: kServiceDoesNotExist, kAccessDenied, kInvalidHandle,
// kServiceMarkedForDelete for a service that was deleted while the handle was open. One thread.
class IServiceManager {
public:
    virtual ~IServiceManager() = default;

    virtual Status openManager(std::uint32_t access, ServiceHandle& manager) = 0;

    // kServiceExists: a service has that name. kInvalidName: an empty name, one over 255 characters or with
    // a slash of either kind. kServiceMarkedForDelete: a service of that name was deleted, but it still runs or a
    // handle of it is still open at the end of `deletionWait`. kDuplicateServiceName: its display name is in use, on
    // hosts that check it.
    virtual Status createService(ServiceHandle manager, const ServiceDefinition& definition,
                                 ServiceHandle& service) = 0;

    virtual Status openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                               ServiceHandle& service) = 0;

    // Sets the start type and leaves everything else of the service unchanged.
    virtual Status changeStartType(ServiceHandle service, ServiceStart start) = 0;

    // Sets everything in the definition except the name.
    virtual Status configureService(ServiceHandle service, const ServiceDefinition& definition) = 0;

    // Starts without arguments. kServiceAlreadyRunning; kFileNotFound when the program is missing.
    virtual Status startService(ServiceHandle service) = 0;

    // Sends the stop control; succeeds if the service accepted it. kServiceNotActive: the service does not run.
    // kServiceTakesNoControl: it is starting or stopping.
    virtual Status stopService(ServiceHandle service) = 0;

    // Waits until the service has stopped. kWaitTimedOut: it has not.
    virtual Status waitForStop(ServiceHandle service, std::uint32_t milliseconds) = 0;

    virtual Status queryState(ServiceHandle service, ServiceState& state) = 0;

    // Deletes the service; it is gone once its handles are closed.
    virtual Status deleteService(ServiceHandle service) = 0;

    virtual Status closeHandle(ServiceHandle handle) = 0;
};

using OwnedService = OwnedHandle<PortTraits<IServiceManager, ServiceHandle, &IServiceManager::closeHandle>>;

}  // namespace kz7
