// Runs a flow again and again, failing its first call, its second, and so on until a run passes untouched.
#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <optional>
#include <string>

#include "install/platform/faulty/platform.h"
#include "tests/support/machine.h"

namespace kz7::test {

using FaultyMachine = FaultyPlatform<Machine>;

inline constexpr Status kFault = 4321;  // no platform's number, so that it is recognised wherever it goes

// `check` sees every run: the machine afterwards and the flow's status; a failure of it, or something left open, tells
// the call. Returns the number of calls of the run that passed.
inline std::uint64_t sweepFaults(bool forGood, const std::function<void(FaultyMachine&)>& prepare,
                                 const std::function<Status(FaultyMachine&)>& flow,
                                 const std::function<void(FaultyMachine&, Status)>& check) {
    for (std::uint64_t call = 1;; ++call) {
        std::optional<testing::ScopedTrace> row;  // goes after the machine, which looks for what was left open
        FaultyMachine machine(FaultCounter(0, false, kFault));
        prepare(machine);
        machine.faults_ = FaultCounter(call, forGood, kFault);
        const Status status = flow(machine);
        const std::string failed = machine.faults_.failed();
        row.emplace(__FILE__, __LINE__,
                    "call " + std::to_string(call) + " (" + failed + ") fails" + (forGood ? " for good" : ""));
        check(machine, status);
        if (failed.empty()) {
            return machine.faults_.calls();
        }
    }
}

}  // namespace kz7::test
