// The subcommands of kz7admin, each in a file of its own.
#pragma once

#include "install/admin/command_line.h"

namespace kz7 {

// clang-format off
void addAliasesCommand(Command& program, Admin& admin);
void addApplyCommand(Command& program, Admin& admin);
void addBackupCommand(Command& program, Admin& admin);
void addCheckCommand(Command& program, Admin& admin);
void addCommitCommand(Command& program, Admin& admin);
void addCompletionCommand(Command& program, Admin& admin);
void addCopiesCommand(Command& program, Admin& admin);
void addDiffCommand(Command& program, Admin& admin);
void addEnsureCommand(Command& program, Admin& admin);
void addExplainCommand(Command& program, Admin& admin);
void addExportCommand(Command& program, Admin& admin);
void addFactsCommand(Command& program, Admin& admin);
void addFrontCommand(Command& program, Admin& admin);
void addHistoryCommand(Command& program, Admin& admin);
void addImportCommand(Command& program, Admin& admin);
void addRepairCommand(Command& program, Admin& admin);
void addReportCommand(Command& program, Admin& admin);
void addResolveCommand(Command& program, Admin& admin);
void addRestoreCommand(Command& program, Admin& admin);
void addTreeCommand(Command& program, Admin& admin);
void addUndoCommand(Command& program, Admin& admin);
// clang-format on

}  // namespace kz7
