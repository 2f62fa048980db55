// The console port on the C library's streams: people at a console see every character, files and pipes get the active
// code page.
#pragma once

#include "install/platform/console.h"

namespace kz7 {

class WindowsConsole final : public IConsole {
public:
    Status writeOutput(std::string_view text) override;
    Status writeError(std::string_view text) override;
    Status writeDocument(std::string_view text) override;
    Status flush() override { return streams_->flush(); }

private:
    std::unique_ptr<IConsole> streams_ = standardConsole();
};

}  // namespace kz7
