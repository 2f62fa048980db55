// kz7admin import: does what a file of registry-editor text asks for, all of it or nothing that is kept.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addImportCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
