// One owner for every kind of port handle: closes what it holds on every path, moves, never copies.
#pragma once

#include <utility>

namespace kz7 {

// Traits: `using Port`, `using Handle`, `static constexpr Handle kNone`, `static void close(Port&, Handle)`.
template <typename Traits>
class OwnedHandle {
public:
    using Port = typename Traits::Port;
    using Handle = typename Traits::Handle;

    explicit OwnedHandle(Port& port) : port_(&port) {}
    OwnedHandle(OwnedHandle&& other) noexcept
        : port_(other.port_), handle_(std::exchange(other.handle_, Traits::kNone)) {}
    OwnedHandle& operator=(OwnedHandle&& other) noexcept {
        if (this != &other) {
            reset();
            port_ = other.port_;
            handle_ = std::exchange(other.handle_, Traits::kNone);
        }
        return *this;
    }
    OwnedHandle(const OwnedHandle&) = delete;
    OwnedHandle& operator=(const OwnedHandle&) = delete;
    ~OwnedHandle() { reset(); }

    Handle get() const { return handle_; }
    explicit operator bool() const { return handle_ != Traits::kNone; }

    // For an operation's output parameter; closes what was held before.
    Handle& receive() {
        reset();
        return handle_;
    }

    void reset() {
        if (handle_ != Traits::kNone) {
            Traits::close(*port_, std::exchange(handle_, Traits::kNone));
        }
    }

    // Gives the handle up without closing it: it stays open to the end of the process. Only where the
    // flow is meant to leave it open; the caller says why.
    void leaveOpen() { handle_ = Traits::kNone; }

private:
    Port* port_;
    Handle handle_ = Traits::kNone;
};

}  // namespace kz7
