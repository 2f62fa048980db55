#include "install/platform/windows/line_channel.h"

#include <fcntl.h>
#include <io.h>

#include <cstdio>

#include "install/platform/standard_input.h"

namespace kz7 {

Status WindowsLineChannel::readLine(Buffer& line) {
    return readStandardLine(line);
}

void WindowsLineChannel::keepLineFeeds(bool on) {
    std::fflush(stdout);
    if (on) {
        modeBefore_ = _setmode(_fileno(stdout), _O_BINARY);
    } else if (modeBefore_ != -1) {
        _setmode(_fileno(stdout), modeBefore_);
    }
}

}  // namespace kz7
