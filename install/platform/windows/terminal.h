// The terminal port on this host.
#pragma once

#include <atomic>

#include "install/platform/terminal.h"

namespace kz7 {

class WindowsTerminal final : public ITerminal {
public:
    Status readLine(Buffer& line) override;
    void endReading() override;
    void keepLineFeeds(bool on) override;
    TerminalView look(TerminalStream stream) override;
    void leaveInterruptsToOthers(bool on) override;

private:
    int modeBefore_ = -1;                    // of standard output
    std::atomic<unsigned long> reader_ = 0;  // the id of the thread in readLine()
    std::atomic<bool> ended_ = false;
};

}  // namespace kz7
