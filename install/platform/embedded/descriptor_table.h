// What the ports on POSIX give out instead of descriptors: tokens that are never used again. The number of a
// descriptor that is closed could be anything next, the database too.
#pragma once

#include <unistd.h>

#include <cstdint>
#include <map>
#include <mutex>

namespace kz7 {

// `Handle` is an enumeration of 64 bits. Used by any thread. It owns the descriptors that it holds.
template <class Handle>
class DescriptorTable {
public:
    // Tokens up to that number stand for something else.
    explicit DescriptorTable(std::uint64_t taken = 0) : last_(taken) {}
    ~DescriptorTable() {
        for (const auto& [handle, descriptor] : open_) {
            close(descriptor);
        }
    }
    DescriptorTable(const DescriptorTable&) = delete;
    DescriptorTable& operator=(const DescriptorTable&) = delete;

    Handle give(int descriptor) {
        const std::lock_guard<std::mutex> held(lock_);
        const Handle handle{++last_};
        open_.emplace(handle, descriptor);
        return handle;
    }

    // -1, which the system knows for none, where there is none.
    int find(Handle handle) {
        const std::lock_guard<std::mutex> held(lock_);
        const auto found = open_.find(handle);
        return found != open_.end() ? found->second : -1;
    }

    // The same for the last time: it is the caller's to close.
    int take(Handle handle) {
        const std::lock_guard<std::mutex> held(lock_);
        const auto found = open_.find(handle);
        const int descriptor = found != open_.end() ? found->second : -1;
        if (descriptor != -1) {
            open_.erase(found);
        }
        return descriptor;
    }

private:
    std::mutex lock_;
    std::map<Handle, int> open_;
    std::uint64_t last_;
};

}  // namespace kz7
