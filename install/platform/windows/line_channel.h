// The line-channel port on the C library's streams.
#pragma once

#include "install/platform/line_channel.h"

namespace kz7 {

class WindowsLineChannel final : public ILineChannel {
public:
    Status readLine(Buffer& line) override;
    void keepLineFeeds(bool on) override;

private:
    int modeBefore_ = -1;  // of standard output
};

}  // namespace kz7
