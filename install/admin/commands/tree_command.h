// kz7admin tree: keys and values for reading, on standard output.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addTreeCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
