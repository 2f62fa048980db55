#include <CLI/CLI.hpp>
#include <cstdio>
#include <new>

#include "install/admin/export_command.h"
#include "install/admin/import_command.h"
#include "install/admin/tree_command.h"

int main(int argc, char** argv) {
    try {
        kz7::Admin admin;
        CLI::App program("Looks at what kz7InstallReg wrote and moves it");
        program.add_option("--store", admin.storeDirectory, "The state directory to use instead of the usual one");
        program.require_subcommand(0, 1);
        program.fallthrough();
        kz7::addExportCommand(program, admin);
        kz7::addImportCommand(program, admin);
        kz7::addTreeCommand(program, admin);
        try {
            program.parse(argc, argv);
        } catch (const CLI::Success& help) {
            return program.exit(help);
        } catch (const CLI::ParseError& error) {
            std::fprintf(stderr, "kz7admin: %s (see --help)\n", kz7::shownText(error.what()).c_str());
            return kz7::kAnswerFault;
        }
        if (admin.answer == nullptr) {
            std::fputs("kz7admin: no command is given (see --help)\n", stderr);
            return kz7::kAnswerFault;
        }
        return admin.answer();
    } catch (const std::bad_alloc&) {
        // What was not committed is dropped with the platform.
        std::fputs("kz7admin: out of memory\n", stderr);
        return kz7::kAnswerFault;
    }
}
