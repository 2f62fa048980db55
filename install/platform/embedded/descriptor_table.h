// The handles that ports on POSIX return instead of descriptors: tokens that are never reused. The number of a closed
// descriptor could next name any file, the database included.
#pragma once

#include <cstdint>
#include <mutex>

#include "install/platform/embedded/descriptor.h"
#include "install/platform/handle_table.h"

namespace kz7 {

// `Handle` is a 64-bit enumeration. Thread-safe. Owns its descriptors.
template <class Handle>
class DescriptorTable {
public:
    // Handles up to `taken` are reserved.
    explicit DescriptorTable(std::uint64_t taken = 0) : open_(taken) {}

    Handle give(OwnedDescriptor descriptor) {
        const std::lock_guard<std::mutex> held(lock_);
        return open_.give(std::move(descriptor));
    }

    // -1 if the handle is not in the table; system calls refuse that descriptor.
    int find(Handle handle) {
        const std::lock_guard<std::mutex> held(lock_);
        const OwnedDescriptor* const found = open_.find(handle);
        return found != nullptr ? found->get() : -1;
    }

    // Removes a descriptor from the table and returns it.
    OwnedDescriptor take(Handle handle) {
        const std::lock_guard<std::mutex> held(lock_);
        OwnedDescriptor* const found = open_.find(handle);
        OwnedDescriptor taken = found != nullptr ? std::move(*found) : OwnedDescriptor();
        open_.close(handle);
        return taken;
    }

private:
    std::mutex lock_;
    HandleTable<Handle, OwnedDescriptor> open_;
};

}  // namespace kz7
