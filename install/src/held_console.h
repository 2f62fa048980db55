// Keeps console lines back until what they tell about is on disk.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "install/platform/console.h"

namespace kz7 {

class HeldConsole final : public IConsole {
public:
    Status writeOutput(std::string_view text) override {
        lines_.emplace_back(false, text);
        return kSuccess;
    }
    Status writeError(std::string_view text) override {
        lines_.emplace_back(true, text);
        return kSuccess;
    }
    Status flush() override { return kSuccess; }

    // Writes what was kept, each text to its stream, in order; drops what would have gone to standard output
    // where it did not become true.
    void release(IConsole& console, bool becameTrue) {
        for (const auto& [isError, text] : lines_) {
            if (isError) {
                console.writeError(text);
            } else if (becameTrue) {
                console.writeOutput(text);
            }
        }
        lines_.clear();
    }

private:
    std::vector<std::pair<bool, std::string>> lines_;
};

}  // namespace kz7
