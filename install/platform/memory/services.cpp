#include "install/platform/memory/services.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
MemoryServiceManager::MemoryServiceManager(IFileSystem& files) : files_(files) {}

ServiceHandle MemoryServiceManager::giveOut(std::shared_ptr<Service> service, std::uint32_t access) {
    const auto handle = static_cast<ServiceHandle>(++lastHandle_);
    open_[handle] = {std::move(service), access};
    return handle;
}

Status MemoryServiceManager::managerOf(ServiceHandle handle) const {
    const auto open = open_.find(handle);
    return open == open_.end() || open->second.service != nullptr ? kInvalidHandle : kSuccess;
}

Status MemoryServiceManager::serviceOf(ServiceHandle handle, std::uint32_t needed,
                                       std::shared_ptr<Service>& service) const {
    const auto open = open_.find(handle);
    if (open == open_.end() || open->second.service == nullptr) {
        return kInvalidHandle;
    }
    if ((open->second.access & needed) != needed) {
        return kAccessDenied;
    }
    if (open->second.service->deleted) {
        return kServiceMarkedForDelete;
    }
    service = open->second.service;
    return kSuccess;
}

Status MemoryServiceManager::openManager(std::uint32_t access, ServiceHandle& manager) {
    manager = giveOut(nullptr, access);
    return kSuccess;
}

Status MemoryServiceManager::createService(ServiceHandle manager, const ServiceDefinition& definition,
                                           ServiceHandle& service) {
    if (const Status status = managerOf(manager); status != kSuccess) {
        return status;
    }
    if (!isServiceName(definition.name)) {
        return kInvalidName;
    }
    const bool stillOpen = std::any_of(open_.begin(), open_.end(), [&](const auto& open) {
        const Service* held = open.second.service.get();
        return held != nullptr && held->deleted && equalsIgnoreCase(held->name, definition.name);
    });
    if (stillOpen) {
        return kServiceMarkedForDelete;
    }
    std::shared_ptr<Service>& slot = services_[foldUpper(definition.name)];
    if (slot != nullptr) {
        return kServiceExists;
    }
    slot = std::make_shared<Service>();
    slot->name = definition.name;
    slot->displayName = definition.displayName;
    slot->programPath = definition.programPath;
    slot->type = definition.type;
    slot->start = definition.start;
    slot->errorControl = definition.errorControl;
    service = giveOut(slot, kServiceAllAccess);
    return kSuccess;
}

Status MemoryServiceManager::openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                                         ServiceHandle& service) {
    if (const Status status = managerOf(manager); status != kSuccess) {
        return status;
    }
    if (!isServiceName(name)) {
        return kInvalidName;
    }
    const auto found = services_.find(foldUpper(name));
    if (found == services_.end()) {
        return kServiceDoesNotExist;
    }
    service = giveOut(found->second, access);
    return kSuccess;
}

Status MemoryServiceManager::changeStartType(ServiceHandle service, ServiceStart start) {
    std::shared_ptr<Service> found;
    const Status status = serviceOf(service, kServiceChangeConfig, found);
    if (status == kSuccess) {
        found->start = start;
    }
    return status;
}

Status MemoryServiceManager::startService(ServiceHandle service) {
    std::shared_ptr<Service> found;
    if (const Status status = serviceOf(service, kServiceStartRight, found); status != kSuccess) {
        return status;
    }
    if (found->state == ServiceState::running) {
        return kServiceAlreadyRunning;
    }
    const Status program = files_.probe(found->programPath);
    if (program == kSuccess) {
        found->state = ServiceState::running;
    }
    return program;
}

Status MemoryServiceManager::stopService(ServiceHandle service) {
    std::shared_ptr<Service> found;
    if (const Status status = serviceOf(service, kServiceStop, found); status != kSuccess) {
        return status;
    }
    if (found->state != ServiceState::running) {
        return kServiceNotActive;
    }
    found->state = ServiceState::stopped;
    return kSuccess;
}

Status MemoryServiceManager::queryState(ServiceHandle service, ServiceState& state) {
    std::shared_ptr<Service> found;
    const Status status = serviceOf(service, kServiceQueryStatus, found);
    if (status == kSuccess) {
        state = found->state;
    }
    return status;
}

Status MemoryServiceManager::deleteService(ServiceHandle service) {
    std::shared_ptr<Service> found;
    const Status status = serviceOf(service, kServiceDelete, found);
    if (status == kSuccess) {
        found->deleted = true;
        services_.erase(foldUpper(found->name));
    }
    return status;
}

Status MemoryServiceManager::closeHandle(ServiceHandle handle) {
    return open_.erase(handle) == 0 ? kInvalidHandle : kSuccess;
}

const MemoryServiceManager::Service* MemoryServiceManager::find(std::string_view name) const {
    const auto found = services_.find(foldUpper(name));
    return found == services_.end() ? nullptr : found->second.get();
}

}  // namespace kz7
