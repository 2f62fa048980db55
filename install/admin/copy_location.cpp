#include "install/admin/copy_location.h"

#include "install/platform/service_manager.h"
#include "install/platform/text.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/registry_access.h"
#include "install/src/services/management_service.h"

namespace kz7 {

std::string locationOf(IRegistryStore& registry, const std::string& copyPath) {
    OwnedKey key(registry);
    TextBuffer<10000> location;
    const bool read = registry.openKey(KeyHandle::localMachine, copyPath, kKeyRead, key.receive()) == kSuccess &&
                      queryText(registry, key.get(), layout::kPathName, location) == kSuccess;
    return read ? std::string(location.text()) : std::string{};
}

bool isProgramOf(std::string_view location, std::string_view program) {
    if (program.size() > 1 && program.front() == '"' && program.back() == '"') {
        program = program.substr(1, program.size() - 2);
    }
    return equalsIgnoreCase(program, managementServiceProgram(location).view());
}

Status readServiceProgram(IRegistryStore& registry, std::string_view service, ValueState& program) {
    OwnedKey record(registry);
    std::optional<ValueState> state;
    Status status = registry.openKey(KeyHandle::localMachine, std::string(kServiceKeys).append(service), kKeyQueryValue,
                                     record.receive());
    status = status == kSuccess ? KeyReader(registry).value(record.get(), "ImagePath", state) : status;
    if (status == kSuccess) {
        program = state.value_or(ValueState{});
    }
    return status;
}

}  // namespace kz7
