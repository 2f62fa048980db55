#include "install/platform/windows/ports.h"

#include <windows.h>

#include "install/platform/windows/change_lock.h"
#include "install/platform/windows/native_handle.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

SC_HANDLE native(ServiceHandle handle) {
    return reinterpret_cast<SC_HANDLE>(static_cast<std::uint64_t>(handle));
}

constexpr DWORD kPoll = 20;  // milliseconds between two queries of a wait

// The handle of a call, or the error if it returned none.
Status opened(SC_HANDLE made, ServiceHandle& handle) {
    if (made == nullptr) {
        return GetLastError();
    }
    handle = static_cast<ServiceHandle>(reinterpret_cast<std::uint64_t>(made));
    return kSuccess;
}

class WindowsServiceManager final : public IServiceManager {
public:
    explicit WindowsServiceManager(ChangeLock& lock) : lock_(lock) {}

    Status openManager(std::uint32_t access, ServiceHandle& manager) override {
        if (const Status status = lock_.hold(); status != kSuccess) {
            return status;
        }
        return opened(OpenSCManagerW(nullptr, nullptr, access), manager);
    }

    Status createService(ServiceHandle manager, const ServiceDefinition& definition, ServiceHandle& service) override {
        if (!isServiceName(definition.name)) {
            return kInvalidName;
        }
        const WideText name(definition.name);
        const WideText displayName(definition.displayName);
        const WideText program(definition.programPath);
        const ULONGLONG begin = GetTickCount64();
        for (;;) {
            const Status status =
                opened(CreateServiceW(native(manager), name.c_str(), displayName.c_str(), kServiceAllAccess,
                                      definition.type, static_cast<DWORD>(definition.start), definition.errorControl,
                                      program.c_str(), nullptr, nullptr, nullptr, nullptr, nullptr),
                       service);
            if (status != kServiceMarkedForDelete || GetTickCount64() - begin >= definition.deletionWait) {
                return status;
            }
            Sleep(kPoll);
        }
    }

    Status openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                       ServiceHandle& service) override {
        if (!isServiceName(name)) {
            return kInvalidName;
        }
        return opened(OpenServiceW(native(manager), WideText(name).c_str(), access), service);
    }

    Status changeStartType(ServiceHandle service, ServiceStart start) override {
        return statusOfCall(ChangeServiceConfigW(native(service), SERVICE_NO_CHANGE, static_cast<DWORD>(start),
                                                 SERVICE_NO_CHANGE, nullptr, nullptr, nullptr, nullptr, nullptr,
                                                 nullptr, nullptr));
    }

    Status configureService(ServiceHandle service, const ServiceDefinition& definition) override {
        const WideText displayName(definition.displayName);
        const WideText program(definition.programPath);
        return statusOfCall(ChangeServiceConfigW(native(service), definition.type, static_cast<DWORD>(definition.start),
                                                 definition.errorControl, program.c_str(), nullptr, nullptr, nullptr,
                                                 nullptr, nullptr, displayName.c_str()));
    }

    Status startService(ServiceHandle service) override {
        return statusOfCall(StartServiceW(native(service), 0, nullptr));
    }

    Status stopService(ServiceHandle service) override {
        SERVICE_STATUS answered{};
        return statusOfCall(ControlService(native(service), SERVICE_CONTROL_STOP, &answered));
    }

    Status waitForStop(ServiceHandle service, std::uint32_t milliseconds) override {
        const ULONGLONG begin = GetTickCount64();
        for (;;) {
            ServiceState state{};
            const Status status = queryState(service, state);
            if (status != kSuccess || state == ServiceState::stopped) {
                return status;
            }
            if (GetTickCount64() - begin >= milliseconds) {
                return kWaitTimedOut;
            }
            Sleep(kPoll);
        }
    }

    Status queryState(ServiceHandle service, ServiceState& state) override {
        SERVICE_STATUS answered{};
        const Status status = statusOfCall(QueryServiceStatus(native(service), &answered));
        if (status == kSuccess) {
            state = static_cast<ServiceState>(answered.dwCurrentState);
        }
        return status;
    }

    Status deleteService(ServiceHandle service) override { return statusOfCall(DeleteService(native(service))); }

    Status closeHandle(ServiceHandle handle) override { return statusOfCall(CloseServiceHandle(native(handle))); }

private:
    ChangeLock& lock_;
};

}  // namespace

std::unique_ptr<IServiceManager> windowsServices(ChangeLock& lock) {
    return std::make_unique<WindowsServiceManager>(lock);
}

}  // namespace kz7
