// Makes one chosen call of many fail. All decorators of a machine share one counter, so that "call N" counts
// over every port in the order in which a flow makes its calls.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "install/platform/status.h"

namespace kz7 {

class FaultCounter {
public:
    // Call number `call`, counted from 1, fails with `status`, and with `forGood` every later one too.
    FaultCounter(std::uint64_t call, bool forGood, Status status) : chosen_(call), forGood_(forGood), status_(status) {}

    // Counts a call; what it must answer instead of being made, or kSuccess.
    Status count(std::string_view operation) {
        ++calls_;
        if (calls_ != chosen_ && !(forGood_ && calls_ > chosen_)) {
            return kSuccess;
        }
        if (failed_.empty()) {
            failed_ = operation;
        }
        return status_;
    }

    // The operation that was the first to fail; empty after a run that passed untouched.
    const std::string& failed() const { return failed_; }

    std::uint64_t calls() const { return calls_; }

private:
    std::uint64_t chosen_ = 0;
    bool forGood_ = false;
    Status status_ = kAccessDenied;
    std::uint64_t calls_ = 0;
    std::string failed_;
};

// Makes the call unless its turn to fail has come.
template <typename Call>
Status unlessFailing(FaultCounter& faults, std::string_view operation, Call call) {
    const Status status = faults.count(operation);
    return status != kSuccess ? status : call();
}

// A close that fails closes all the same, so that what a flow leaves open is the flow's own doing.
template <typename Call>
Status closingAnyway(FaultCounter& faults, std::string_view operation, Call call) {
    const Status closed = call();
    const Status status = faults.count(operation);
    return status != kSuccess ? status : closed;
}

}  // namespace kz7
