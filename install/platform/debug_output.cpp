#include "install/platform/debug_output.h"

#include "install/platform/host_information.h"
#include "install/platform/shown_text.h"

namespace kz7 {
namespace {

class HostDebugOutput final : public IDebugOutput {
public:
    HostDebugOutput(IConsole& console, void (*debugger)(std::string_view)) : console_(console), debugger_(debugger) {}

    void write(std::string_view text) override {
        if (debugger_ != nullptr) {
            debugger_(text);
        }
        if (isShown_) {
            console_.writeError("debug: " + shownText(text) + "\n");
        }
    }
    bool isHeard() const override { return isShown_ || debugger_ != nullptr; }

private:
    IConsole& console_;
    void (*debugger_)(std::string_view);
    bool isShown_ = environmentText("KZ7_DEBUG") == "1";
};

}  // namespace

std::unique_ptr<IDebugOutput> hostDebugOutput(IConsole& console, void (*debugger)(std::string_view text)) {
    return std::make_unique<HostDebugOutput>(console, debugger);
}

}  // namespace kz7
