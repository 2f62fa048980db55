// The console port on the C library's streams, on every host alike.
#pragma once

#include "install/platform/console.h"

namespace kz7 {

class StandardConsole final : public IConsole {
public:
    Status writeOutput(std::string_view text) override;
    Status writeError(std::string_view text) override;
    Status flush() override;
};

}  // namespace kz7
