// The rest of the framework's class tree: lists of installed products and instances, and registry key objects.
#pragma once

#include <string>
#include <utility>

#include "install/platform/registry_store.h"
#include "install/src/copies/copy_list.h"
#include "install/src/copies/ilist.h"
#include "install/src/registry/copy_name.h"

namespace kz7 {

class InstalledProd {
public:
    explicit InstalledProd(std::string name) : name_(std::move(name)) {}
    virtual ~InstalledProd() = default;

    const std::string& name() const { return name_; }

private:
    std::string name_;
};

class InstalledProdList : public ILIST<InstalledProd> {};

class IKZ7INSTANCE {
public:
    explicit IKZ7INSTANCE(std::string name) : name_(std::move(name)) {}
    virtual ~IKZ7INSTANCE() = default;

    const std::string& name() const { return name_; }

private:
    std::string name_;
};

class IKZ7INSTANCELIST : public ILIST<IKZ7INSTANCE> {};

// The list that callers share.
class InstallCopyListSingleton : public InstallCopyList {
public:
    using InstallCopyList::InstallCopyList;
};

// A registry key opened or created with the full access rights.
class KZ7iRegistry {
public:
    KZ7iRegistry(IRegistryStore& registry, KeyHandle root, std::string_view path) : key_(registry) {
        status_ = registry.createKey(root, path, {}, kKeyFull, key_.receive());
    }
    virtual ~KZ7iRegistry() = default;

    Status status() const { return status_; }
    KeyHandle key() const { return key_.get(); }

private:
    OwnedKey key_;
    Status status_;
};

// The same for a path with the copy-name placeholder.
class KZ7iCopyNameRegistry : public KZ7iRegistry {
public:
    KZ7iCopyNameRegistry(IRegistryStore& registry, KeyHandle root, std::string_view path, std::string_view copyName)
        : KZ7iRegistry(registry, root, substituteCopyName(path, copyName)) {}
};

}  // namespace kz7
