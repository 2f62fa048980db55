// kz7admin aliases: which copy each version prefix names, which it should name, and why.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addAliasesCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
