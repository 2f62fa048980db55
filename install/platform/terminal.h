// The terminal port: lines of standard input, properties of the terminal, and the interrupt key. Standard input and
// output may be pipes. Output goes through the console port.
#pragma once

#include <cstdint>
#include <functional>

#include "install/platform/buffer.h"
#include "install/platform/status.h"

namespace kz7 {

enum class TerminalStream { input, output, error };

struct TerminalView {
    bool terminal = false;      // false: a file, a pipe or a closed stream
    bool redraws = false;       // a line of the terminal can be redrawn
    bool colours = false;       // the terminal shows colours, and NO_COLOR is not set
    std::uint32_t columns = 0;  // width of the terminal; on POSIX $COLUMNS overrides it
};

class ITerminal {
public:
    virtual ~ITerminal() = default;

    // Reads one line of standard input without its line end, LF or CR LF. The part of a line that does not fit is
    // dropped. kEndOfFile: nothing is left. kOperationAborted: endReading() was called.
    virtual Status readLine(Buffer& line) = 0;

    // Ends a readLine() that waits on another thread; every later one returns at once.
    virtual void endReading() = 0;

    // While on, standard output does not convert line feeds.
    virtual void keepLineFeeds(bool on) = 0;

    // The current properties of the stream; the width of a window can change.
    virtual TerminalView look(TerminalStream stream) = 0;

    // While on, the interrupt key does not end this process. Other programs on the same terminal still receive it.
    virtual void leaveInterruptsToOthers(bool on) = 0;
};

// ITerminal::readLine() for the implementations. `next` gives the next byte, or EOF.
Status readLineOf(const std::function<int()>& next, Buffer& line);

}  // namespace kz7
