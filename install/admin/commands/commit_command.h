// kz7admin commit: sets the configuration in a response file for an installed copy.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addCommitCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
