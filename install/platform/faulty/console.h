// A console whose chosen call fails.
#pragma once

#include "install/platform/console.h"
#include "install/platform/faulty/fault_counter.h"

namespace kz7 {

class FaultyConsole final : public IConsole {
public:
    FaultyConsole(IConsole& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status writeOutput(std::string_view text) override {
        return unlessFailing(faults_, "writeOutput", [&] { return real_.writeOutput(text); });
    }
    Status writeError(std::string_view text) override {
        return unlessFailing(faults_, "writeError", [&] { return real_.writeError(text); });
    }
    Status flush() override {
        return unlessFailing(faults_, "flush", [&] { return real_.flush(); });
    }

private:
    IConsole& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
