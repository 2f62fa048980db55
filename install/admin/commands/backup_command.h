// kz7admin backup: the whole store in one file.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addBackupCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
