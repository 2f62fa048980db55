#include "install/platform/windows/ports.h"

#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <atomic>
#include <cstdio>
#include <string>
#include <vector>

#include "install/platform/encoding.h"

namespace kz7 {
namespace {

BOOL WINAPI leaveIt(DWORD event) {
    return event == CTRL_C_EVENT || event == CTRL_BREAK_EVENT ? TRUE : FALSE;
}

class WindowsTerminal final : public ITerminal {
public:
    WindowsTerminal() = default;
    WindowsTerminal(const WindowsTerminal&) = delete;
    WindowsTerminal& operator=(const WindowsTerminal&) = delete;
    // The console outlives this program; the next one in it may not know such sequences.
    ~WindowsTerminal() override {
        for (const Changed& changed : changed_) {
            SetConsoleMode(changed.console, changed.mode);
        }
    }

    Status readLine(Buffer& line) override {
        reader_ = GetCurrentThreadId();
        std::string room(line.capacity, '\0');
        Buffer narrow(room.data(), line.capacity, line.limit);
        const Status status = ended_ ? kOperationAborted : readLineOf([] { return std::getc(stdin); }, narrow);
        reader_ = 0;
        if (status == kSuccess) {
            const std::string text = textFromNarrow(narrow.view());
            line.size = static_cast<std::uint32_t>(cutText(text, line.limit).copy(line.data, line.capacity));
        }
        return ended_ ? kOperationAborted : status;
    }

    void endReading() override {
        constexpr int kAttempts = 50;
        constexpr DWORD kInterval = 20;  // milliseconds
        ended_ = true;
        // At the first attempt the reader may not be waiting yet.
        for (int attempt = 0; attempt < kAttempts && reader_ != 0; ++attempt) {
            if (const HANDLE reader = OpenThread(THREAD_TERMINATE, FALSE, reader_); reader != nullptr) {
                CancelSynchronousIo(reader);
                CloseHandle(reader);
            }
            Sleep(kInterval);
        }
    }

    void keepLineFeeds(bool on) override {
        std::fflush(stdout);
        if (on) {
            modeBefore_ = _setmode(_fileno(stdout), _O_BINARY);
        } else if (modeBefore_ != -1) {
            _setmode(_fileno(stdout), modeBefore_);
        }
    }

    TerminalView look(TerminalStream stream) override {
        // The handles of the C streams: a standard-handle slot may have been changed.
        std::FILE* const file = stream == TerminalStream::input    ? stdin
                                : stream == TerminalStream::output ? stdout
                                                                   : stderr;
        const auto handle = reinterpret_cast<HANDLE>(_get_osfhandle(_fileno(file)));
        TerminalView view;
        DWORD mode = 0;
        view.terminal = GetConsoleMode(handle, &mode) != FALSE;
        CONSOLE_SCREEN_BUFFER_INFO screen{};
        if (view.terminal && GetConsoleScreenBufferInfo(handle, &screen) != FALSE) {
            view.columns = static_cast<std::uint32_t>(screen.srWindow.Right - screen.srWindow.Left + 1);
            view.redraws = (mode & ENABLE_VIRTUAL_TERMINAL_PROCESSING) != 0;
            if (!view.redraws) {
                changed_.reserve(changed_.size() + 1);
                view.redraws = SetConsoleMode(handle, mode | ENABLE_VIRTUAL_TERMINAL_PROCESSING) != FALSE;
            }
            if (view.redraws && (mode & ENABLE_VIRTUAL_TERMINAL_PROCESSING) == 0) {
                changed_.push_back({handle, mode});
            }
            view.colours = view.redraws && environmentText("NO_COLOR").empty();
        }
        return view;
    }

    void leaveInterruptsToOthers(bool on) override { SetConsoleCtrlHandler(leaveIt, on ? TRUE : FALSE); }

private:
    struct Changed {
        HANDLE console;
        DWORD mode;  // before the change
    };

    int modeBefore_ = -1;            // of standard output
    std::atomic<DWORD> reader_ = 0;  // the id of the thread in readLine()
    std::atomic<bool> ended_ = false;
    std::vector<Changed> changed_;
};

}  // namespace

std::unique_ptr<ITerminal> windowsTerminal() {
    return std::make_unique<WindowsTerminal>();
}

}  // namespace kz7
