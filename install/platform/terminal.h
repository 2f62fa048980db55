// The terminal port: what people see standard output and error on, and what their interrupt key does.
#pragma once

#include <cstdint>

namespace kz7 {

enum class TerminalStream { input, output, error };

struct TerminalView {
    bool terminal = false;      // else a file, a pipe or nothing
    bool redraws = false;       // a terminal on which a line can be drawn again
    bool colours = false;       // and colours are welcome
    std::uint32_t columns = 0;  // of a terminal
};

class ITerminal {
public:
    virtual ~ITerminal() = default;

    // How the stream is seen now: people change the width of a window.
    virtual TerminalView look(TerminalStream stream) = 0;

    // While on, the interrupt key does not end this process. The programs on the same terminal get it as ever.
    virtual void leaveInterruptsToOthers(bool on) = 0;
};

}  // namespace kz7
