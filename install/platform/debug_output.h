// The debugger output port: diagnostic texts that are not for the console.
#pragma once

#include <string_view>

namespace kz7 {

class IDebugOutput {
public:
    virtual ~IDebugOutput() = default;

    // One message; it cannot fail. Where no debugger listens it is shown on standard error when
    // KZ7_DEBUG=1 is set, and is silent otherwise.
    virtual void write(std::string_view text) = 0;

    // False where it is known that nobody sees the messages: a caller with many need not compose them.
    virtual bool isHeard() const { return true; }
};

}  // namespace kz7
