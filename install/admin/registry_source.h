// What a command line can name as a registry: "." for this machine's store, "@N" for it as it was before run N of the
// history, the state directory of another store, a backup, or a file of registry-editor text. Errors are reported here.
#pragma once

#include <memory>
#include <string>

#include "install/admin/admin.h"
#include "install/platform/history.h"
#include "install/platform/memory/registry.h"
#include "install/src/registry/change_set.h"

namespace kz7 {

class RegistrySource {
public:
    RegistrySource(Admin& admin, std::string place) : admin_(admin), place_(std::move(place)) {}

    // For reading; after admin.open().
    Answer open();

    // Reports why the registry may lack a part of what it had: a damaged store, or a text that was cut off, describes
    // changes, or only keys below one of the product's. After open().
    Answer examine();

    // Only after open().
    IRegistryStore& registry() { return *registry_; }

    // Whether all of it is the product's: everything but this machine's own registry.
    bool isOwn() const { return isOwn_; }

    // Reads a key with everything below it, or without a key everything. A key that does not exist reads as nothing.
    // `wholeServices`: see readSnapshot().
    Answer read(const std::string& key, bool wholeServices, Snapshot& snapshot);

    // Reads the product's keys and services only.
    Answer readProduct(bool wholeServices, Snapshot& snapshot);

private:
    Answer openBefore(std::uint64_t number);
    Answer takeBack(const HistoryRun& run, std::uint64_t number);
    Answer openStore(std::string PlatformOptions::*place);
    Answer readFrom(const std::vector<KeyStart>& starts, Status found, bool wholeServices, Snapshot& snapshot);

    Admin& admin_;
    std::string place_;
    std::unique_ptr<IPlatform> platform_;  // of another store
    MemoryRegistry memory_;                // of a file
    IRegistryStore* registry_ = nullptr;
    bool isOwn_ = true;
    std::string doubt_;  // why a text may not be a whole export
};

}  // namespace kz7
