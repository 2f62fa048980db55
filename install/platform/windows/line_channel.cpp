#include "install/platform/windows/terminal.h"

#include <fcntl.h>
#include <io.h>

#include <cstdio>

namespace kz7 {

Status WindowsTerminal::readLine(Buffer& line) {
    return readStandardLine(line);
}

void WindowsTerminal::keepLineFeeds(bool on) {
    std::fflush(stdout);
    if (on) {
        modeBefore_ = _setmode(_fileno(stdout), _O_BINARY);
    } else if (modeBefore_ != -1) {
        _setmode(_fileno(stdout), modeBefore_);
    }
}

}  // namespace kz7
