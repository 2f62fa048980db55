// The open handles of a port that keeps its own objects.
#pragma once

#include <cstdint>
#include <map>
#include <utility>

namespace kz7 {

// `Handle` is a 64-bit enumeration. No number is used again, so that a closed handle never names another object.
template <typename Handle, typename Item>
class HandleTable {
public:
    // Handles up to `taken` are reserved.
    explicit HandleTable(std::uint64_t taken = 0) : last_(taken) {}

    Handle give(Item item) {
        const Handle handle{last_ + 1};
        items_.emplace(handle, std::move(item));
        ++last_;
        return handle;
    }

    // Null for a handle that is not open.
    Item* find(Handle handle) {
        const auto found = items_.find(handle);
        return found == items_.end() ? nullptr : &found->second;
    }

    // False for a handle that is not open.
    bool close(Handle handle) { return items_.erase(handle) != 0; }

    std::size_t size() const { return items_.size(); }
    auto begin() { return items_.begin(); }
    auto end() { return items_.end(); }

private:
    std::map<Handle, Item> items_;
    std::uint64_t last_;
};

}  // namespace kz7
