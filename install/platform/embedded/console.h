// The console port on the C library's streams.
#pragma once

#include "install/platform/console.h"

namespace kz7 {

class EmbeddedConsole final : public IConsole {
public:
    Status writeOutput(std::string_view text) override;
    Status writeError(std::string_view text) override;
    Status flush() override;
};

}  // namespace kz7
