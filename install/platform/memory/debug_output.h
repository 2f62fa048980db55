// The debugger output port in memory.
#pragma once

#include <string>
#include <vector>

#include "install/platform/debug_output.h"

namespace kz7 {

class MemoryDebugOutput final : public IDebugOutput {
public:
    void write(std::string_view text) override { messages.emplace_back(text); }

    std::vector<std::string> messages;
};

}  // namespace kz7
