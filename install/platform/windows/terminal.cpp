#include "install/platform/windows/terminal.h"

#include <io.h>
#include <windows.h>

#include <cstdio>
#include <cstdlib>

namespace kz7 {
namespace {

BOOL WINAPI leaveIt(DWORD event) {
    return event == CTRL_C_EVENT || event == CTRL_BREAK_EVENT ? TRUE : FALSE;
}

}  // namespace

// The console outlives this program, and its next one may know nothing of such sequences.
WindowsTerminal::~WindowsTerminal() {
    for (const Changed& changed : changed_) {
        SetConsoleMode(changed.console, changed.mode);
    }
}

TerminalView WindowsTerminal::look(TerminalStream stream) {
    // The streams' own handles: a standard-handle slot may name something else by now.
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
        const char* noColour = std::getenv("NO_COLOR");
        view.colours = view.redraws && (noColour == nullptr || *noColour == '\0');
    }
    return view;
}

void WindowsTerminal::leaveInterruptsToOthers(bool on) {
    SetConsoleCtrlHandler(leaveIt, on ? TRUE : FALSE);
}

}  // namespace kz7
