#include <CLI/CLI.hpp>
#include <cstdio>
#include <exception>
#include <new>

#include "install/admin/commands/aliases_command.h"
#include "install/admin/commands/commit_command.h"
#include "install/admin/commands/copies_command.h"
#include "install/admin/commands/export_command.h"
#include "install/admin/commands/front_command.h"
#include "install/admin/commands/import_command.h"
#include "install/admin/commands/tree_command.h"
#include "install/platform/encoding.h"
#include "install/platform/program.h"

namespace kz7 {
namespace {

// Before there are ports, or without them.
void tellFault(const std::string& reason) {
    std::fputs(narrowFromText("kz7admin: " + reason + '\n').c_str(), stderr);
}

int run(int argc, char** argv) {
    Admin admin;
    CLI::App program("Looks at what kz7InstallReg wrote and moves it", "kz7admin");
    program.add_option("--store", admin.storeDirectory, "The state directory to use instead of the usual one");
    program.require_subcommand(0, 1);
    program.fallthrough();
    addAliasesCommand(program, admin);
    addCommitCommand(program, admin);
    addCopiesCommand(program, admin);
    addExportCommand(program, admin);
    addFrontCommand(program, admin);
    addImportCommand(program, admin);
    addTreeCommand(program, admin);
    try {
        program.parse(argc, argv);
    } catch (const CLI::Success& help) {
        return program.exit(help);
    } catch (const CLI::ParseError& error) {
        tellFault(shownText(error.what()) + " (see --help)");
        return kAnswerFault;
    }
    if (admin.answer == nullptr) {
        std::fputs("kz7admin: no command is given (see --help)\n", stderr);
        return kAnswerFault;
    }
    return admin.answer();
}

}  // namespace
}  // namespace kz7

int kz7::programMain(int argc, char** argv) {
    // What was not committed is dropped with the platform.
    try {
        return run(argc, argv);
    } catch (const std::bad_alloc&) {
        std::fputs("kz7admin: out of memory\n", stderr);
    } catch (const std::exception& error) {
        tellFault(shownText(error.what()));
    }
    return kAnswerFault;
}
