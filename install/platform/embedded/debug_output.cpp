#include "install/platform/embedded/ports.h"

#include <cstdlib>

#include "install/platform/shown_text.h"

#include "install/platform/shown_text.h"

namespace kz7 {
namespace {

// The debugger output port without a debugger: standard error if KZ7_DEBUG=1 is set.
class EmbeddedDebugOutput final : public IDebugOutput {
public:
    explicit EmbeddedDebugOutput(IConsole& console) : console_(console) {
        const char* asked = std::getenv("KZ7_DEBUG");
        shown_ = asked != nullptr && std::string_view(asked) == "1";
    }

    void write(std::string_view text) override {
        if (shown_) {
            console_.writeError("debug: " + shownText(text) + "\n");
        }
    }

    bool isHeard() const override { return shown_; }

private:
    IConsole& console_;
    bool shown_;
};

}  // namespace

std::unique_ptr<IDebugOutput> embeddedDebugOutput(IConsole& console) {
    return std::make_unique<EmbeddedDebugOutput>(console);
}

}  // namespace kz7
