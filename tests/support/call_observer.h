// Sees every call of the ports that it observes, and may make some of them fail.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

#include "install/platform/status.h"

namespace kz7::test {

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

// Makes one chosen call fail. All ports of a machine share one counter, so that "call N" counts over every port in the
// order in which a flow makes its calls. For one thread.
class FaultCounter final : public ICallObserver {
public:
    // Call number `call`, counted from 1, fails with `status`, and with `forGood` every later one too.
    FaultCounter(std::uint64_t call, bool forGood, Status status) : chosen_(call), forGood_(forGood), status_(status) {}

    Status before() override {
        ++calls_;
        return calls_ == chosen_ || (forGood_ && calls_ > chosen_) ? status_ : kSuccess;
    }
    void after(const PortCall& call) override {
        if (call.status != kSuccess && calls_ == chosen_ && failed_.empty()) {
            failed_ = call.operation;
            failedCall_ = call.text();
        }
    }

    // The operation that was the first to fail; empty if none did.
    const std::string& failed() const { return failed_; }

    // The first failed call with its arguments.
    const std::string& failedCall() const { return failedCall_; }

    std::uint64_t calls() const { return calls_; }

private:
    std::uint64_t chosen_ = 0;
    bool forGood_ = false;
    Status status_ = kAccessDenied;
    std::uint64_t calls_ = 0;
    std::string failed_;
    std::string failedCall_;
};

}  // namespace kz7::test
