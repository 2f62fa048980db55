// The subcommands of kz7admin, each in a file of its own.
#pragma once

#include "install/admin/admin.h"

namespace CLI {
class App;
}

namespace kz7 {

// clang-format off
void addAliasesCommand(CLI::App& program, Admin& admin);
void addApplyCommand(CLI::App& program, Admin& admin);
void addBackupCommand(CLI::App& program, Admin& admin);
void addCheckCommand(CLI::App& program, Admin& admin);
void addCommitCommand(CLI::App& program, Admin& admin);
void addCopiesCommand(CLI::App& program, Admin& admin);
void addDiffCommand(CLI::App& program, Admin& admin);
void addEnsureCommand(CLI::App& program, Admin& admin);
void addExplainCommand(CLI::App& program, Admin& admin);
void addExportCommand(CLI::App& program, Admin& admin);
void addFactsCommand(CLI::App& program, Admin& admin);
void addFrontCommand(CLI::App& program, Admin& admin);
void addHistoryCommand(CLI::App& program, Admin& admin);
void addImportCommand(CLI::App& program, Admin& admin);
void addRepairCommand(CLI::App& program, Admin& admin);
void addReportCommand(CLI::App& program, Admin& admin);
void addResolveCommand(CLI::App& program, Admin& admin);
void addRestoreCommand(CLI::App& program, Admin& admin);
void addTreeCommand(CLI::App& program, Admin& admin);
void addUndoCommand(CLI::App& program, Admin& admin);
// clang-format on

}  // namespace kz7
