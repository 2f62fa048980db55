// Holds console lines back until the changes that they report are committed.
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

    // Writes the held texts in order, each to its stream.
    void release(IConsole& console) {
        for (const auto& [isError, text] : lines_) {
            if (isError) {
                console.writeError(text);
            } else {
                console.writeOutput(text);
            }
        }
        lines_.clear();
    }

private:
    std::vector<std::pair<bool, std::string>> lines_;
};

}  // namespace kz7
