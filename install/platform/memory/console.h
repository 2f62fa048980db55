// The console port in memory: keeps what was written for whoever looks at it afterwards.
#pragma once

#include <string>

#include "install/platform/console.h"

namespace kz7 {

class MemoryConsole final : public IConsole {
public:
    Status writeOutput(std::string_view text) override {
        output += text;
        both += text;
        return kSuccess;
    }
    Status writeError(std::string_view text) override {
        flush();
        error += text;
        both += text;
        return kSuccess;
    }
    Status flush() override {
        flushed = output.size();
        return kSuccess;
    }

    std::string output;
    std::string error;
    std::string both;         // in the order of the calls
    std::size_t flushed = 0;  // bytes of `output` that a child's output would come after
};

}  // namespace kz7
