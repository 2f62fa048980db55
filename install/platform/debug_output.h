// The debugger output port: diagnostic texts that are not for the console.
#pragma once

#include <memory>
#include <string_view>

#include "install/platform/console.h"

namespace kz7 {

class IDebugOutput {
public:
    virtual ~IDebugOutput() = default;

    // Sends one message; cannot fail. If KZ7_DEBUG=1 is set the message is also written to standard error.
    virtual void write(std::string_view text) = 0;

    // False if nobody can see the messages, so that a caller with many of them need not compose them.
    virtual bool isHeard() const { return true; }
};

// `debugger` passes a text to the debugger of this host; null on a host without one.
std::unique_ptr<IDebugOutput> hostDebugOutput(IConsole& console, void (*debugger)(std::string_view text));

}  // namespace kz7
