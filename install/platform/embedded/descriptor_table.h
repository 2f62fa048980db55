// The handles that ports on POSIX return instead of descriptors: tokens that are never reused. The number of a closed
// descriptor could next name any file, the database included.
#pragma once

#include <cstdint>
#include <map>
#include <mutex>

#include "install/platform/embedded/descriptor.h"

namespace kz7 {

// `Handle` is a 64-bit enumeration. Thread-safe. Owns its descriptors.
template <class Handle>
class DescriptorTable {
public:
    // Handles up to `taken` are reserved.
    explicit DescriptorTable(std::uint64_t taken = 0) : last_(taken) {}

    Handle give(OwnedDescriptor descriptor) {
        const std::lock_guard<std::mutex> held(lock_);
        const Handle handle{last_ + 1};
        open_.emplace(handle, std::move(descriptor));
        ++last_;
        return handle;
    }

    // -1 if the handle is not in the table; system calls refuse that descriptor.
    int find(Handle handle) {
        const std::lock_guard<std::mutex> held(lock_);
        const auto found = open_.find(handle);
        return found != open_.end() ? found->second.get() : -1;
    }

    // Removes a descriptor from the table and returns it.
    OwnedDescriptor take(Handle handle) {
        const std::lock_guard<std::mutex> held(lock_);
        const auto found = open_.find(handle);
        OwnedDescriptor taken;
        if (found != open_.end()) {
            taken = std::move(found->second);
            open_.erase(found);
        }
        return taken;
    }

private:
    std::mutex lock_;
    std::map<Handle, OwnedDescriptor> open_;
    std::uint64_t last_;
};

}  // namespace kz7
