// The RAII owner of every kind of port handle. It moves and never copies.
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

    // For an output parameter; closes the held handle first.
    Handle& receive() {
        reset();
        return handle_;
    }

    void reset() {
        if (handle_ != Traits::kNone) {
            Traits::close(*port_, std::exchange(handle_, Traits::kNone));
        }
    }

    // Releases the handle without closing it: it stays open until the process ends. The caller states the reason.
    void leaveOpen() { handle_ = Traits::kNone; }

private:
    Port* port_;
    Handle handle_ = Traits::kNone;
};

// The traits of a handle that an operation of its port closes.
template <typename PortType, typename HandleType, auto closeOperation>
struct PortTraits {
    using Port = PortType;
    using Handle = HandleType;
    static constexpr Handle kNone = Handle::none;
    static void close(Port& port, Handle handle) { (port.*closeOperation)(handle); }
};

}  // namespace kz7
