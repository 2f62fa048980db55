// kz7admin aliases: the copy that each version prefix names, the one that it should name, and why.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addAliasesCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
