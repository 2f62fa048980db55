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
    _setmode(_fileno(stdout), on ? _O_BINARY : _O_TEXT);
}

}  // namespace kz7
