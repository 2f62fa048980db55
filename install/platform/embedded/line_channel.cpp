#include "install/platform/embedded/line_channel.h"

#include "install/platform/standard_input.h"

namespace kz7 {

Status EmbeddedLineChannel::readLine(Buffer& line) {
    return readStandardLine(line);
}

// Line feeds are one byte here in any case.
void EmbeddedLineChannel::keepLineFeeds(bool) {}

}  // namespace kz7
