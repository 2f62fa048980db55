#include "install/platform/windows/terminal.h"

#include <windows.h>

#include <cstdlib>

namespace kz7 {
namespace {

BOOL WINAPI leaveIt(DWORD event) {
    return event == CTRL_C_EVENT || event == CTRL_BREAK_EVENT ? TRUE : FALSE;
}

}  // namespace

TerminalView WindowsTerminal::look(TerminalStream stream) {
    const HANDLE handle = GetStdHandle(stream == TerminalStream::input    ? STD_INPUT_HANDLE
                                       : stream == TerminalStream::output ? STD_OUTPUT_HANDLE
                                                                          : STD_ERROR_HANDLE);
    TerminalView view;
    DWORD mode = 0;
    view.terminal = GetConsoleMode(handle, &mode) != FALSE;
    CONSOLE_SCREEN_BUFFER_INFO screen{};
    if (view.terminal && GetConsoleScreenBufferInfo(handle, &screen) != FALSE) {
        view.columns = static_cast<std::uint32_t>(screen.srWindow.Right - screen.srWindow.Left + 1);
        view.redraws = SetConsoleMode(handle, mode | ENABLE_VIRTUAL_TERMINAL_PROCESSING) != FALSE;
        const char* noColour = std::getenv("NO_COLOR");
        view.colours = view.redraws && (noColour == nullptr || *noColour == '\0');
    }
    return view;
}

void WindowsTerminal::leaveInterruptsToOthers(bool on) {
    SetConsoleCtrlHandler(leaveIt, on ? TRUE : FALSE);
}

}  // namespace kz7
