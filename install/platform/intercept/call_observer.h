// Sees every call of the ports that it observes, and may make some of them fail.
#pragma once

#include <functional>
#include <string>
#include <string_view>

#include "install/platform/status.h"

namespace kz7 {

// One call of a port. The texts are valid during the observation only.
struct PortCall {
    std::string_view port;       // "registry"
    std::string_view operation;  // "openKey"
    Status status = kSuccess;    // the result; kSuccess for an operation without a status

    // Composes the arguments as text. Outputs show what was written, "?" if the call failed.
    const std::function<std::string()>& arguments;

    // registry.openKey(0x80000002, "SOFTWARE", 131097, ?) = 2
    std::string text() const {
        return std::string(port) + '.' + std::string(operation) + '(' + arguments() + ") = " + std::to_string(status);
    }
};

class ICallObserver {
public:
    virtual ~ICallObserver() = default;

    // Called before each call that returns a status. Any result but kSuccess becomes the result of the call, and the
    // port is not called. Only handles are closed in any case, so that a leak of a handle is always the caller's.
    virtual Status before() { return kSuccess; }

    // Called after each call, on the thread that made it.
    virtual void after(const PortCall& call) = 0;
};

}  // namespace kz7
