// Buffers that a caller lends to a port. Their sizes are behaviour (a value that does not fit answers
// kMoreData), so they are handed over as they are and never grown behind the caller's back.
#pragma once

#include <array>
#include <cstdint>
#include <string_view>

namespace kz7 {

// Room lent to an operation, and how much of it was filled.
struct Buffer {
    Buffer(char* room, std::uint32_t bytes) : data(room), capacity(bytes) {}

    // What was filled in; after kMoreData nothing, since `size` then tells the room that was missing.
    std::string_view view() const { return {data, size <= capacity ? size : 0}; }

    // The filled bytes up to the first NUL.
    std::string_view text() const { return view().substr(0, view().find('\0')); }

    char* data;
    std::uint32_t capacity;  // bytes; a name's terminating NUL must fit too
    std::uint32_t size = 0;  // bytes filled, a name without its NUL; after kMoreData the bytes needed
};

template <std::uint32_t Capacity>
struct FixedBuffer : Buffer {
    FixedBuffer() : Buffer(nullptr, Capacity) { data = room_.data(); }
    FixedBuffer(const FixedBuffer&) = delete;
    FixedBuffer& operator=(const FixedBuffer&) = delete;

private:
    std::array<char, Capacity> room_{};
};

}  // namespace kz7
