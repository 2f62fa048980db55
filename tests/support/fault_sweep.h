// Runs a flow repeatedly: first its first call fails, then its second, and so on, until no call fails.
#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <optional>
#include <string>

#include "tests/support/intercepted_ports.h"
#include "tests/support/machine.h"

namespace kz7::test {

// A machine whose flows meet the faults in any of its ports. Calls of its plain members do not.
class FaultyMachine : public Machine {
public:
    FaultyMachine() { ports_ = intercepted_.ports(); }

    FaultCounter faults_{0, false, kSuccess};

private:
    InterceptedPorts intercepted_{ports_, faults_};
};

inline constexpr Status kFault = 4321;  // not a number of any platform, so that it can be recognised

// `check` gets the machine and the flow's status after every run; its failures and leaks are reported with the call.
// Returns the number of calls of the run without a failure.
inline std::uint64_t sweepFaults(bool forGood, const std::function<void(FaultyMachine&)>& prepare,
                                 const std::function<Status(FaultyMachine&)>& flow,
                                 const std::function<void(FaultyMachine&, Status)>& check) {
    for (std::uint64_t call = 1;; ++call) {
        std::optional<testing::ScopedTrace> row;  // destroyed after the machine, which checks for leaks
        FaultyMachine machine;
        prepare(machine);
        machine.faults_ = FaultCounter(call, forGood, kFault);
        const Status status = flow(machine);
        const std::string failed = machine.faults_.failed();
        row.emplace(
            __FILE__, __LINE__,
            "call " + std::to_string(call) + ", " + machine.faults_.failedCall() + (forGood ? " for good" : ""));
        check(machine, status);
        if (failed.empty()) {
            return machine.faults_.calls();
        }
    }
}

}  // namespace kz7::test
