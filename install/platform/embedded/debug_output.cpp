#include "install/platform/embedded/debug_output.h"

#include <cstdlib>
#include <string>

#include "install/platform/shown_text.h"

namespace kz7 {

EmbeddedDebugOutput::EmbeddedDebugOutput(IConsole& console) : console_(console) {
    const char* asked = std::getenv("KZ7_DEBUG");
    shown_ = asked != nullptr && std::string_view(asked) == "1";
}

void EmbeddedDebugOutput::write(std::string_view text) {
    if (shown_) {
        console_.writeError("debug: " + shownText(text) + "\n");
    }
}

}  // namespace kz7
