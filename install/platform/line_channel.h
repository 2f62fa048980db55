// The line-channel port: standard input and output as whoever answers this process uses them, a program at the
// other ends of two pipes or a person at a terminal. Texts go out through the console port.
#pragma once

#include "install/platform/buffer.h"
#include "install/platform/status.h"

namespace kz7 {

class ILineChannel {
public:
    virtual ~ILineChannel() = default;

    // One line of standard input without its line end, a carriage return before it included. What does not
    // fit is read and lost, so that it is never taken for a line of its own. kEndOfFile: nothing is left.
    virtual Status readLine(Buffer& line) = 0;

    // While on, a line feed on standard output is written as that one byte on every host.
    virtual void keepLineFeeds(bool on) = 0;
};

}  // namespace kz7
