#include "install/src/copies/install_copy_list.h"

#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

#include "install/src/registry/copy_layout.h"
#include "install/src/registry/registry_access.h"

namespace kz7 {

InstallCopy::InstallCopy(IRegistryStore& registry, std::string_view copyName, bool view32, bool view64)
    : copyName_(copyName), view32_(view32 ? kKeyView32 : 0), view64_(view64 ? kKeyView64 : 0) {
    read(registry, copyName);
}

void InstallCopy::read(IRegistryStore& registry, std::string_view copyName) {
    version8_ = equalsIgnoreCase(copyName, layout::kVersion8Copy);
    bool fits = keyPath_.assign(version8_ ? layout::kProduct : layout::kCopies);
    if (!version8_) {
        fits = fits && keyPath_.append("\\") && keyPath_.append(copyName);
    }
    OwnedKey key(registry);
    FixedBuffer<256> path;
    // A path that was cut would name another copy's key.
    if (!fits ||
        registry.openKey(KeyHandle::localMachine, keyPath(), kKeyQueryValue | view32_ | view64_, key.receive()) !=
            kSuccess ||
        queryText(registry, key.get(), layout::kPathName, path) != kSuccess) {
        status_ = kUnreadable;
        return;
    }
    key.reset();
    std::string_view kept = path.text();
    if (!kept.empty() && kept.back() == '\\') {
        kept.remove_suffix(1);
    }
    installPath_.assign(kept);

    const std::string base(keyPath());
    perUser_ = registry.openKey(KeyHandle::localMachine, base + "\\Users", kKeyQueryValue, key.receive()) == kSuccess;
    if (view32_ != 0 && registry.openKey(KeyHandle::localMachine, base + "\\Components", kKeyQueryValue | view32_,
                                         key.receive()) != kSuccess) {
        status_ = kNoComponents;
    }
    readComponents(registry);
}

void InstallCopy::readComponents(IRegistryStore& registry) {
    OwnedKey key(registry);
    const KeyHandle root = perUser_ ? KeyHandle::currentUser : KeyHandle::localMachine;
    const AccessMask view = perUser_ ? view32_ : view32_ | view64_;
    if (registry.openKey(root, compose("%s\\COMPONENTS", {keyPath()}), kKeyQueryValue | view, key.receive()) !=
        kSuccess) {
        return;
    }
    FixedBuffer<255> name;
    // An error ends the walk like its normal end: a name that fills the buffer would answer kMoreData for ever.
    for (std::uint32_t index = 0; registry.enumerateValue(key.get(), index, name, nullptr, nullptr) == kSuccess;
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
    FixedBuffer<256> version;
    return registry.openKey(KeyHandle::localMachine, layout::kCurrentVersion, kKeyQueryValue | view32_ | view64_,
                            key.receive()) == kSuccess &&
           queryText(registry, key.get(), "Version", version) == kSuccess &&
           std::atoi(std::string(version.text()).c_str()) == 8;
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
    if (registry.openKey(KeyHandle::localMachine, layout::kCopies,
                         kKeyQueryValue | kKeyEnumerateSubkeys | view32_ | view64_, copies.receive()) != kSuccess) {
        return;
    }
    FixedBuffer<256> name;
    for (std::uint32_t index = 0;; ++index) {
        const Status found = registry.enumerateKey(copies.get(), index, name, nullptr);
        if (found != kSuccess) {
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
    const FixedText<65> searched{std::string_view(name)};
    saveCursor();
    InstallCopy* copy = first();
    while (copy != nullptr && !equalsIgnoreCase(copy->copyName(), searched.view())) {
        copy = next();
    }
    restoreCursor();
    return copy;
}

}  // namespace kz7
