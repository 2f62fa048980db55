// Buffers that a caller passes to a port. Their sizes are behaviour: a value that does not fit is kMoreData. So no
// operation makes a buffer larger.
#pragma once

#include <array>
#include <cstdint>
#include <string_view>

#include "install/platform/text.h"

namespace kz7 {

// A caller's buffer, and how much of it an operation filled. For a text the limit counts characters (UTF-16 units,
// with the NUL), for other data bytes.
struct Buffer {
    Buffer(char* room, std::uint32_t bytes) : Buffer(room, bytes, bytes) {}
    Buffer(char* room, std::uint32_t bytes, std::uint32_t most) : data(room), capacity(bytes), limit(most) {}

    // The filled part; empty after kMoreData, when `size` is the size needed.
    std::string_view view() const { return {data, refused || size > capacity ? 0 : size}; }

    // The filled bytes up to the first NUL.
    std::string_view text() const { return view().substr(0, view().find('\0')); }

    char* data;
    std::uint32_t capacity;  // bytes
    std::uint32_t limit;     // characters of a text, bytes of other data
    std::uint32_t size = 0;  // bytes filled, a name without its NUL; after kMoreData the bytes needed
    bool refused = false;    // the data exceed the limit
};

// A buffer with its room.
template <std::uint32_t Bytes, std::uint32_t Limit>
struct RoomBuffer : Buffer {
    RoomBuffer() : Buffer(nullptr, Bytes, Limit) { data = room_.data(); }
    RoomBuffer(const RoomBuffer&) = delete;
    RoomBuffer& operator=(const RoomBuffer&) = delete;

private:
    std::array<char, Bytes> room_{};
};

// Room for that many bytes, texts included.
template <std::uint32_t Bytes>
using FixedBuffer = RoomBuffer<Bytes, Bytes>;

// Room for a text of that many characters with its NUL, or for as many bytes of other data.
template <std::uint32_t Characters>
using TextBuffer = RoomBuffer<kBytesOfCharacter * Characters, Characters>;

}  // namespace kz7
