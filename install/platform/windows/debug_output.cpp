#include "install/platform/windows/ports.h"

#include <windows.h>

#include <cstdlib>
#include <string>

#include "install/platform/shown_text.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

// A debugger that listens; standard error too if KZ7_DEBUG=1 is set.
class WindowsDebugOutput final : public IDebugOutput {
public:
    explicit WindowsDebugOutput(IConsole& console) : console_(console) {
        const char* asked = std::getenv("KZ7_DEBUG");
        shown_ = asked != nullptr && std::string_view(asked) == "1";
    }

    void write(std::string_view text) override {
        OutputDebugStringW(WideText(text).c_str());
        if (shown_) {
            console_.writeError("debug: " + shownText(text) + "\n");
        }
    }

private:
    IConsole& console_;
    bool shown_;
};

}  // namespace

std::unique_ptr<IDebugOutput> windowsDebugOutput(IConsole& console) {
    return std::make_unique<WindowsDebugOutput>(console);
}

}  // namespace kz7
