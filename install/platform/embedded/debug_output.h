// The debugger output port where no debugger listens: standard error when KZ7_DEBUG=1 is set.
#pragma once

#include "install/platform/console.h"
#include "install/platform/debug_output.h"

namespace kz7 {

class EmbeddedDebugOutput final : public IDebugOutput {
public:
    explicit EmbeddedDebugOutput(IConsole& console);

    void write(std::string_view text) override;
    bool isHeard() const override { return shown_; }

private:
    IConsole& console_;
    bool shown_;
};

}  // namespace kz7
