// What the ports on POSIX give out instead of descriptors: tokens that are never used again. The number of a
// descriptor that is closed could be anything next, the database too.
#pragma once

#include <cstdint>
#include <map>
#include <mutex>

#include "install/platform/embedded/descriptor.h"

namespace kz7 {

// `Handle` is an enumeration of 64 bits. Used by any thread. It owns the descriptors that it holds.
template <class Handle>
class DescriptorTable {
public:
    // Tokens up to that number stand for something else.
    explicit DescriptorTable(std::uint64_t taken = 0) : last_(taken) {}

    Handle give(OwnedDescriptor descriptor) {
        const std::lock_guard<std::mutex> held(lock_);
        const Handle handle{last_ + 1};
        open_.emplace(handle, std::move(descriptor));
        ++last_;
        return handle;
    }

    // -1, which the system knows for none, where there is none.
    int find(Handle handle) {
        const std::lock_guard<std::mutex> held(lock_);
        const auto found = open_.find(handle);
        return found != open_.end() ? found->second.get() : -1;
    }

    // Takes it out of the table.
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
