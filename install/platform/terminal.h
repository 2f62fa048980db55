// The terminal port: lines of standard input, what people see the standard streams on, and what their interrupt key
// does. The other end may be a program at two pipes as well as a person. Output goes through the console port.
#pragma once

#include <cstdint>
#include <functional>

#include "install/platform/buffer.h"
#include "install/platform/status.h"

namespace kz7 {

enum class TerminalStream { input, output, error };

struct TerminalView {
    bool terminal = false;      // else a file, a pipe or nothing
    bool redraws = false;       // a terminal on which a line can be drawn again
    bool colours = false;       // and colours are welcome
    std::uint32_t columns = 0;  // of a terminal; on POSIX $COLUMNS overrules its size
};

class ITerminal {
public:
    virtual ~ITerminal() = default;

    // Reads one line of standard input without its line end; a carriage return before it belongs to the line end.
    // What does not fit is read and dropped, so that it never passes for a line of its own. kEndOfFile: nothing is
    // left. kOperationAborted: endReading() was called.
    virtual Status readLine(Buffer& line) = 0;

    // Ends a readLine() that waits on another thread; every later one ends at once.
    virtual void endReading() = 0;

    // While on, a line feed on standard output is written as that one byte on every host.
    virtual void keepLineFeeds(bool on) = 0;

    // The stream as it is now: people change the width of a window.
    virtual TerminalView look(TerminalStream stream) = 0;

    // While on, the interrupt key does not end this process. The programs on the same terminal get it as ever.
    virtual void leaveInterruptsToOthers(bool on) = 0;
};

// ITerminal::readLine() for the implementations. `next` gives the next byte, or EOF.
Status readLineOf(const std::function<int()>& next, Buffer& line);

}  // namespace kz7
