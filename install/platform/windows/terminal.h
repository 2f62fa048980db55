// The terminal port on this host.
#pragma once

#include "install/platform/terminal.h"

namespace kz7 {

class WindowsTerminal final : public ITerminal {
public:
    Status readLine(Buffer& line) override;
    void keepLineFeeds(bool on) override;
    TerminalView look(TerminalStream stream) override;
    void leaveInterruptsToOthers(bool on) override;

private:
    int modeBefore_ = -1;  // of standard output
};

}  // namespace kz7
