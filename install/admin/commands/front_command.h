// kz7admin front: runs an installer program and shows its progress.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addFrontCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
