// The terminal port on this host.
#pragma once

#include <atomic>
#include <vector>

#include "install/platform/terminal.h"

namespace kz7 {

class WindowsTerminal final : public ITerminal {
public:
    WindowsTerminal() = default;
    WindowsTerminal(const WindowsTerminal&) = delete;
    WindowsTerminal& operator=(const WindowsTerminal&) = delete;
    ~WindowsTerminal() override;

    Status readLine(Buffer& line) override;
    void endReading() override;
    void keepLineFeeds(bool on) override;
    TerminalView look(TerminalStream stream) override;
    void leaveInterruptsToOthers(bool on) override;

private:
    struct Changed {
        void* console;
        std::uint32_t mode;  // that it had before
    };

    int modeBefore_ = -1;                    // of standard output
    std::atomic<unsigned long> reader_ = 0;  // the id of the thread in readLine()
    std::atomic<bool> ended_ = false;
    std::vector<Changed> changed_;
};

}  // namespace kz7
