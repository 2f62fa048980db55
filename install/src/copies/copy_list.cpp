#include "install/src/copies/copy_list.h"

#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

#include "install/src/registry/copy_layout.h"
#include "install/src/registry/registry_access.h"

namespace kz7 {

InstallCopy::InstallCopy(IRegistryStore& registry, std::string_view copyName, bool view32, bool view64)
    : name_(copyName),
      copyName_(copyName),
      version8_(equalsIgnoreCase(copyName, layout::kVersion8Copy)),
      view32_(view32 ? kKeyView32 : 0),
      view64_(view64 ? kKeyView64 : 0) {
    read(registry);
}

void InstallCopy::read(IRegistryStore& registry) {
    const std::string base = version8_ ? std::string(layout::kProduct) : compose("%s\\%s", {layout::kCopies, name_});
    keyPath_.assign(base);
    OwnedKey key(registry);
    TextBuffer<256> path;
    if (!succeeded(
            registry.openKey(KeyHandle::localMachine, base, kKeyQueryValue | view32_ | view64_, key.receive())) ||
        !succeeded(queryText(registry, key.get(), layout::kPathName, path))) {
        status_ = kUnreadable;
        return;
    }
    key.reset();
    std::string_view kept = path.text();
    if (!kept.empty() && kept.back() == '\\') {
        kept.remove_suffix(1);
    }
    installPath_.assign(kept);

    perUser_ = succeeded(registry.openKey(KeyHandle::localMachine, base + "\\Users", kKeyQueryValue, key.receive()));
    if (view32_ != 0 && !succeeded(registry.openKey(KeyHandle::localMachine, base + "\\Components",
                                                    kKeyQueryValue | view32_, key.receive()))) {
        status_ = kNoComponents;
    }
    readComponents(registry, base);
}

void InstallCopy::readComponents(IRegistryStore& registry, const std::string& base) {
    OwnedKey key(registry);
    const KeyHandle root = perUser_ ? KeyHandle::currentUser : KeyHandle::localMachine;
    const AccessMask view = perUser_ ? view32_ : view32_ | view64_;
    if (!succeeded(registry.openKey(root, base + "\\COMPONENTS", kKeyQueryValue | view, key.receive()))) {
        return;
    }
    TextBuffer<255> name;
    // Any error ends the walk: a name that does not fit the buffer would return kMoreData for ever.
    for (std::uint32_t index = 0; succeeded(registry.enumerateValue(key.get(), index, name, nullptr, nullptr));
         ++index) {
        auto* kept = static_cast<char*>(std::malloc(name.size + 1));
        if (kept == nullptr) {
            return;
        }
        std::memcpy(kept, name.data, name.size);
        kept[name.size] = '\0';
        components_.append(kept);
    }
}

InstallCopyList::InstallCopyList(IRegistryStore& registry, IDebugOutput& debug, bool view32, bool view64)
    : view32_(view32 ? kKeyView32 : 0), view64_(view64 ? kKeyView64 : 0) {
    build(registry, debug);
}

bool InstallCopyList::hasVersion8(IRegistryStore& registry) const {
    OwnedKey key(registry);
    TextBuffer<256> version;
    return succeeded(registry.openKey(KeyHandle::localMachine, layout::kCurrentVersion,
                                      kKeyQueryValue | view32_ | view64_, key.receive())) &&
           succeeded(queryText(registry, key.get(), "Version", version)) &&
           // Clamps a number that is too large; atoi() would wrap it around.
           std::strtol(std::string(version.text()).c_str(), nullptr, 10) == 8;
}

void InstallCopyList::build(IRegistryStore& registry, IDebugOutput& debug) {
    if (hasVersion8(registry)) {
        auto copy = std::make_unique<InstallCopy>(registry, layout::kVersion8Copy, view32_ != 0, false);
        if (copy->status() != InstallCopy::kValid) {
            status_ = 1;
            return;
        }
        version8Copy_ = copy.get();
        append(copy.release());
    }
    OwnedKey copies(registry);
    if (!succeeded(registry.openKey(KeyHandle::localMachine, layout::kCopies,
                                    kKeyQueryValue | kKeyEnumerateSubkeys | view32_ | view64_, copies.receive()))) {
        return;
    }
    TextBuffer<256> name;
    for (std::uint32_t index = 0;; ++index) {
        const Status found = registry.enumerateKey(copies.get(), index, name, nullptr);
        if (!succeeded(found)) {
            status_ = isEndOfItems(found) ? status_ : 1;
            return;
        }
        auto copy = std::make_unique<InstallCopy>(registry, name.view(), view32_ != 0, false);
        if (copy->status() == InstallCopy::kValid) {
            append(copy.release());
        } else {
            debug.write("Invalid Installation Name");
            debug.write(name.view());
        }
    }
}

InstallCopy* InstallCopyList::findByName(const char* name) {
    if (name == nullptr) {
        return nullptr;
    }
    saveCursor();
    InstallCopy* copy = first();
    // By whole names: the first 64 characters of two copies may agree.
    while (copy != nullptr && !equalsIgnoreCase(copy->name(), name)) {
        copy = next();
    }
    restoreCursor();
    return copy;
}

}  // namespace kz7
