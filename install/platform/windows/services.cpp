#include "install/platform/windows/services.h"

#include <windows.h>

#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

SC_HANDLE native(ServiceHandle handle) {
    return reinterpret_cast<SC_HANDLE>(static_cast<std::uint64_t>(handle));
}

// The status of a call that gives a handle.
Status opened(SC_HANDLE made, ServiceHandle& handle) {
    if (made == nullptr) {
        return GetLastError();
    }
    handle = static_cast<ServiceHandle>(reinterpret_cast<std::uint64_t>(made));
    return kSuccess;
}

Status done(BOOL result) {
    return result ? kSuccess : GetLastError();
}

}  // namespace

Status WindowsServiceManager::openManager(std::uint32_t access, ServiceHandle& manager) {
    return opened(OpenSCManagerW(nullptr, nullptr, access), manager);
}

Status WindowsServiceManager::createService(ServiceHandle manager, const ServiceDefinition& definition,
                                            ServiceHandle& service) {
    if (!isServiceName(definition.name)) {
        return kInvalidName;
    }
    return opened(CreateServiceW(native(manager), WideText(definition.name).c_str(),
                                 WideText(definition.displayName).c_str(), kServiceAllAccess, definition.type,
                                 static_cast<DWORD>(definition.start), definition.errorControl,
                                 WideText(definition.programPath).c_str(), nullptr, nullptr, nullptr, nullptr, nullptr),
                  service);
}

Status WindowsServiceManager::openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                                          ServiceHandle& service) {
    if (!isServiceName(name)) {
        return kInvalidName;
    }
    return opened(OpenServiceW(native(manager), WideText(name).c_str(), access), service);
}

Status WindowsServiceManager::changeStartType(ServiceHandle service, ServiceStart start) {
    return done(ChangeServiceConfigW(native(service), SERVICE_NO_CHANGE, static_cast<DWORD>(start), SERVICE_NO_CHANGE,
                                     nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr));
}

Status WindowsServiceManager::startService(ServiceHandle service) {
    return done(StartServiceW(native(service), 0, nullptr));
}

Status WindowsServiceManager::stopService(ServiceHandle service) {
    SERVICE_STATUS answered{};
    return done(ControlService(native(service), SERVICE_CONTROL_STOP, &answered));
}

Status WindowsServiceManager::queryState(ServiceHandle service, ServiceState& state) {
    SERVICE_STATUS answered{};
    const Status status = done(QueryServiceStatus(native(service), &answered));
    if (status == kSuccess) {
        state = static_cast<ServiceState>(answered.dwCurrentState);
    }
    return status;
}

Status WindowsServiceManager::deleteService(ServiceHandle service) {
    return done(DeleteService(native(service)));
}

Status WindowsServiceManager::closeHandle(ServiceHandle handle) {
    return done(CloseServiceHandle(native(handle)));
}

}  // namespace kz7
