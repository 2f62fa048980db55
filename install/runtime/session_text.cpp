#include "install/runtime/session_text.h"

namespace kz7 {

std::string escapedForSession(std::string_view text) {
    std::string escaped;
    for (const char c : text) {
        if (c == '[' || c == ']') {
            escaped += "[\\";
            escaped += c;
            escaped += ']';
        } else {
            escaped += c;
        }
    }
    return escaped;
}

}  // namespace kz7
