// The debugger output port: a debugger that listens; with KZ7_DEBUG=1 standard error too.
#pragma once

#include "install/platform/console.h"
#include "install/platform/debug_output.h"

namespace kz7 {

class WindowsDebugOutput final : public IDebugOutput {
public:
    explicit WindowsDebugOutput(IConsole& console);

    void write(std::string_view text) override;

private:
    IConsole& console_;
    bool shown_;
};

}  // namespace kz7
