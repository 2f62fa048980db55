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

namespace kz7 {
namespace {

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
        std::fprintf(stderr, "kz7admin: %s (see --help)\n", shownText(error.what()).c_str());
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

int main(int argc, char** argv) {
    // What was not committed is dropped with the platform.
    try {
        return kz7::run(argc, argv);
    } catch (const std::bad_alloc&) {
        std::fputs("kz7admin: out of memory\n", stderr);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "kz7admin: %s\n", kz7::shownText(error.what()).c_str());
    }
    return kz7::kAnswerFault;
}
