#include "install/admin/copy_location.h"

#include "install/src/registry/copy_layout.h"
#include "install/src/registry/registry_access.h"

namespace kz7 {

std::string locationOf(IRegistryStore& registry, const std::string& copyPath) {
    OwnedKey key(registry);
    TextBuffer<10000> location;
    const bool read = registry.openKey(KeyHandle::localMachine, copyPath, kKeyRead, key.receive()) == kSuccess &&
                      queryText(registry, key.get(), layout::kPathName, location) == kSuccess;
    return read ? std::string(location.text()) : std::string{};
}

}  // namespace kz7
