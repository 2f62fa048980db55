// kz7admin copies: the installed copies of both registry views and their services.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addCopiesCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
