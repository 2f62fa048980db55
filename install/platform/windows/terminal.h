// The terminal port on this host.
#pragma once

#include "install/platform/terminal.h"

namespace kz7 {

class WindowsTerminal final : public ITerminal {
public:
    TerminalView look(TerminalStream stream) override;
    void leaveInterruptsToOthers(bool on) override;
};

}  // namespace kz7
