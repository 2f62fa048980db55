// Makes one chosen call fail. All ports of a machine share one counter, so that "call N" counts over every port in the
// order in which a flow makes its calls.
#pragma once

#include <cstdint>
#include <string>

#include "install/platform/intercept/call_observer.h"

namespace kz7 {

// For one thread.
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

}  // namespace kz7
