// A terminal, or none, as a test wants it.
#pragma once

#include "install/platform/terminal.h"

namespace kz7 {

class MemoryTerminal final : public ITerminal {
public:
    TerminalView look(TerminalStream) override { return view; }
    void leaveInterruptsToOthers(bool on) override { leavesInterrupts = on; }

    TerminalView view;
    bool leavesInterrupts = false;
};

}  // namespace kz7
