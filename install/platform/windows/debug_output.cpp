#include "install/platform/windows/debug_output.h"

#include <windows.h>

#include <cstdlib>
#include <string>

#include "install/platform/shown_text.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {

WindowsDebugOutput::WindowsDebugOutput(IConsole& console) : console_(console) {
    const char* asked = std::getenv("KZ7_DEBUG");
    shown_ = asked != nullptr && std::string_view(asked) == "1";
}

void WindowsDebugOutput::write(std::string_view text) {
    OutputDebugStringW(WideText(text).c_str());
    if (shown_) {
        console_.writeError("debug: " + shownText(text) + "\n");
    }
}

}  // namespace kz7
