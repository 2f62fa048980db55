// kz7admin commit: configuration of a response file, set for an installed copy.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

void addCommitCommand(CLI::App& program, Admin& admin);

}  // namespace kz7
