// The line-channel port in memory: answers that a test lays ready.
#pragma once

#include <algorithm>
#include <string>

#include "install/platform/line_channel.h"

namespace kz7 {

class MemoryLineChannel final : public ILineChannel {
public:
    Status readLine(Buffer& line) override {
        if (input.empty()) {
            return kEndOfFile;
        }
        const std::size_t end = std::min(input.find('\n'), input.size());
        std::string_view text(input.data(), end);
        text.remove_suffix(text.ends_with('\r') ? 1 : 0);
        line.size = static_cast<std::uint32_t>(text.copy(line.data, line.capacity));
        input.erase(0, end + 1);
        return kSuccess;
    }
    void keepLineFeeds(bool on) override { keepsLineFeeds = on; }

    std::string input;  // what is left to read
    bool keepsLineFeeds = false;
};

}  // namespace kz7
