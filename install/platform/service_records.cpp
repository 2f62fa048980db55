#include "install/platform/service_records.h"

#include <algorithm>
#include <array>
#include <vector>

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kStart = "Start";
constexpr std::string_view kImagePath = "ImagePath";

std::string bytesOf(std::uint32_t number) {
    std::string bytes(sizeof number, '\0');
    for (char& byte : bytes) {
        byte = static_cast<char>(number & 0xFF);
        number >>= 8;
    }
    return bytes;
}

std::string terminated(std::string_view text) {
    return std::string(text) + '\0';
}

Status writeRecord(IRegistryStore& registry, KeyHandle record, const ServiceDefinition& definition) {
    Status status = kSuccess;
    for (const ServiceValue& value : serviceValues(definition)) {
        status = status == kSuccess ? registry.setValue(record, value.name, value.type, value.data) : status;
    }
    return status;
}

}  // namespace

std::vector<ServiceValue> serviceValues(const ServiceDefinition& definition,
                                        std::initializer_list<std::string_view> names) {
    std::vector<ServiceValue> values = {
        {"Type", ValueType::dword, bytesOf(definition.type)},
        {kStart, ValueType::dword, bytesOf(static_cast<std::uint32_t>(definition.start))},
        {"ErrorControl", ValueType::dword, bytesOf(definition.errorControl)},
        {kImagePath, ValueType::expandSz, terminated(definition.programPath)},
        {"DisplayName", ValueType::sz, terminated(definition.displayName)},
        {"ObjectName", ValueType::sz, terminated("LocalSystem")},
    };
    std::erase_if(values, [&](const ServiceValue& value) {
        return names.size() != 0 && std::find(names.begin(), names.end(), value.name) == names.end();
    });
    return values;
}

Status ServiceRecords::managerOf(ServiceHandle handle) {
    const Open* open = open_.find(handle);
    return open == nullptr || !open->recordPath.empty() ? kInvalidHandle : kSuccess;
}

Status ServiceRecords::recordOf(ServiceHandle handle, std::uint32_t needed, OwnedKey& record) {
    const Open* open = open_.find(handle);
    if (open == nullptr || open->recordPath.empty()) {
        return kInvalidHandle;
    }
    if ((open->access & needed) != needed) {
        return kAccessDenied;
    }
    if (open->deleted) {
        return kServiceMarkedForDelete;
    }
    const Status status =
        registry_.openKey(KeyHandle::localMachine, open->recordPath, kKeyQueryValue | kKeySetValue, record.receive());
    return isNotFound(status) ? kServiceMarkedForDelete : status;
}

Status ServiceRecords::openManager(std::uint32_t access, ServiceHandle& manager) {
    manager = open_.give({{}, access});
    return kSuccess;
}

Status ServiceRecords::createService(ServiceHandle manager, const ServiceDefinition& definition,
                                     ServiceHandle& service) {
    if (const Status status = managerOf(manager); status != kSuccess) {
        return status;
    }
    if (!isServiceName(definition.name)) {
        return kInvalidName;
    }
    const std::string path = std::string(kServiceKeys) + std::string(definition.name);
    const bool stillOpen = std::any_of(open_.begin(), open_.end(), [&](const auto& open) {
        return open.second.deleted && equalsIgnoreCase(open.second.recordPath, path);
    });
    if (stillOpen) {
        return kServiceMarkedForDelete;
    }
    OwnedKey record(registry_);
    Status status = registry_.openKey(KeyHandle::localMachine, path, kKeyQueryValue, record.receive());
    if (status == kSuccess) {
        return kServiceExists;
    }
    if (isNotFound(status)) {
        status = registry_.createKey(KeyHandle::localMachine, path, {}, kKeyFull, record.receive());
    }
    status = status == kSuccess ? writeRecord(registry_, record.get(), definition) : status;
    if (status == kSuccess) {
        service = open_.give({path, kServiceAllAccess});
    }
    return status;
}

Status ServiceRecords::configureService(ServiceHandle service, const ServiceDefinition& definition) {
    OwnedKey record(registry_);
    const Status status = recordOf(service, kServiceChangeConfig, record);
    return status == kSuccess ? writeRecord(registry_, record.get(), definition) : status;
}

Status ServiceRecords::openService(ServiceHandle manager, std::string_view name, std::uint32_t access,
                                   ServiceHandle& service) {
    if (const Status status = managerOf(manager); status != kSuccess) {
        return status;
    }
    if (!isServiceName(name)) {
        return kInvalidName;
    }
    const std::string path = std::string(kServiceKeys) + std::string(name);
    OwnedKey record(registry_);
    const Status status = registry_.openKey(KeyHandle::localMachine, path, kKeyQueryValue, record.receive());
    if (status != kSuccess) {
        return isNotFound(status) ? kServiceDoesNotExist : status;
    }
    service = open_.give({path, access});
    return kSuccess;
}

Status ServiceRecords::changeStartType(ServiceHandle service, ServiceStart start) {
    OwnedKey record(registry_);
    const Status status = recordOf(service, kServiceChangeConfig, record);
    return status != kSuccess
               ? status
               : registry_.setValue(record.get(), kStart, ValueType::dword, bytesOf(static_cast<std::uint32_t>(start)));
}

Status ServiceRecords::recordOf(ServiceHandle handle, std::uint32_t needed, OwnedKey& record, ServiceState& state) {
    if (const Status status = recordOf(handle, needed, record); status != kSuccess) {
        return status;
    }
    FixedBuffer<4> number;
    const Status status = registry_.queryValue(record.get(), kServiceRunState, nullptr, number);
    if (status != kSuccess && !isNotFound(status) && status != kMoreData) {
        return status;
    }
    const bool runs = status == kSuccess && number.view() == bytesOf(static_cast<std::uint32_t>(ServiceState::running));
    state = runs ? ServiceState::running : ServiceState::stopped;
    return kSuccess;
}

// Deliberate: no process is started, only the record changes; flows and administrators read the record.
Status ServiceRecords::startService(ServiceHandle service) {
    OwnedKey record(registry_);
    ServiceState now{};
    Status status = recordOf(service, kServiceStartRight, record, now);
    if (status != kSuccess) {
        return status;
    }
    if (now == ServiceState::running) {
        return kServiceAlreadyRunning;
    }
    TextBuffer<1024> program;
    status = registry_.queryValue(record.get(), kImagePath, nullptr, program);
    if (status == kSuccess) {
        std::string_view path = program.text();
        if (path.starts_with('"')) {
            path = path.substr(1, path.find('"', 1) - 1);
        }
        status = files_.probe(path);
    }
    return status != kSuccess ? status
                              : registry_.setValue(record.get(), kServiceRunState, ValueType::dword,
                                                   bytesOf(static_cast<std::uint32_t>(ServiceState::running)));
}

Status ServiceRecords::stopService(ServiceHandle service) {
    OwnedKey record(registry_);
    ServiceState now{};
    const Status status = recordOf(service, kServiceStop, record, now);
    if (status != kSuccess) {
        return status;
    }
    return now == ServiceState::running ? registry_.deleteValue(record.get(), kServiceRunState) : kServiceNotActive;
}

// No service here changes its state by itself.
Status ServiceRecords::waitForStop(ServiceHandle service, std::uint32_t) {
    ServiceState now{};
    const Status status = queryState(service, now);
    return status != kSuccess || now == ServiceState::stopped ? status : kWaitTimedOut;
}

Status ServiceRecords::queryState(ServiceHandle service, ServiceState& state) {
    OwnedKey record(registry_);
    return recordOf(service, kServiceQueryStatus, record, state);
}

// By handles and without recursion: a tree of keys may be deeper than a path is long, or than the stack.
Status ServiceRecords::deleteRecord(const std::string& path) {
    std::vector<OwnedKey> keys;
    Status status =
        registry_.openKey(KeyHandle::localMachine, path, kKeyEnumerateSubkeys, keys.emplace_back(registry_).receive());
    while (status == kSuccess && !keys.empty()) {
        const KeyHandle key = keys.back().get();
        TextBuffer<kMaxKeyName + 1> below;
        status = registry_.enumerateKey(key, 0, below, nullptr);
        if (status == kSuccess) {
            status = registry_.openKey(key, below.view(), kKeyEnumerateSubkeys, keys.emplace_back(registry_).receive());
        } else if (isEndOfItems(status)) {
            status = registry_.deleteKey(key, {}, 0);
            keys.pop_back();
        }
    }
    return status;
}

Status ServiceRecords::deleteService(ServiceHandle service) {
    OwnedKey record(registry_);
    Status status = recordOf(service, kServiceDelete, record);
    if (status != kSuccess) {
        return status;
    }
    const std::string path = open_.find(service)->recordPath;
    status = deleteRecord(path);
    if (status == kSuccess) {
        for (auto& [handle, open] : open_) {
            open.deleted = open.deleted || equalsIgnoreCase(open.recordPath, path);
        }
    }
    return status;
}

Status ServiceRecords::closeHandle(ServiceHandle handle) {
    return open_.close(handle) ? kSuccess : kInvalidHandle;
}

}  // namespace kz7
