// kz7admin export: keys as registry-editor text, or as JSON for programs, on standard output.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addExportCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
