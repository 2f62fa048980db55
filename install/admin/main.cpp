#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdio>
#include <exception>
#include <new>
#include <sstream>

#include "install/admin/commands/commands.h"
#include "install/platform/console.h"
#include "install/platform/program.h"

namespace kz7 {
namespace {

constexpr const char* kFooter =
    "The usual state directory is $KZ7_STATE_DIR; else /var/lib/kz7 for root; else\n"
    "$XDG_STATE_HOME/kz7 or ~/.local/state/kz7. On Windows the store is the registry\n"
    "of the machine.\n"
    "\n"
    "Exit codes: 0 done; 1 not found, nothing to show, different, or something\n"
    "failed; 2 a store, file, key or output cannot be used, or the command line is\n"
    "wrong; 3 with --detailed-exitcode: done, and something changed. front exits as\n"
    "its program does.\n";

bool isVersion(const std::string& text) {
    return !text.empty() && text.find_first_not_of("0123456789.") == std::string::npos && text.front() != '.' &&
           text.back() != '.' && text.find("..") == std::string::npos;
}

// Without the zeros at the end: 1.0 is 1.0.0.
std::vector<unsigned long> numbersOf(const std::string& version) {
    std::vector<unsigned long> numbers;
    std::istringstream parts(version);
    for (std::string part; std::getline(parts, part, '.');) {
        numbers.push_back(std::strtoul(part.c_str(), nullptr, 10));
    }
    while (!numbers.empty() && numbers.back() == 0) {
        numbers.pop_back();
    }
    return numbers;
}

// The check of a version that the caller needs. Nothing is done by a program that is older.
CLI::Validator notOlder() {
    return {[](const std::string& needed) {
                if (!isVersion(needed)) {
                    return "not a version: " + shownText(needed);
                }
                const bool isOlder = numbersOf(KZ7_VERSION) < numbersOf(needed);
                return isOlder ? "this is version " KZ7_VERSION ", older than " + needed : std::string{};
            },
            {}};
}

// What help prints is output like any other. It opens no store.
Answer showHelp(const CLI::App& program, const CLI::Success& help) {
    std::ostringstream text;
    program.exit(help, text, text);
    const auto platform = hostPlatform({.program = "kz7admin"});
    IConsole& console = platform->console();
    Status status = console.writeOutput(text.str());
    status = status == kSuccess ? console.flush() : status;
    return status == kSuccess || status == kPipeClosing ? kAnswerYes : kAnswerFault;
}

// Whether the words ask for JSON, where they cannot be parsed. What follows "--" belongs to another program.
bool asksForJson(const std::vector<std::string>& words) {
    const auto end = std::find(words.begin(), words.end(), "--");
    return std::find(words.begin(), end, "--json") != end;
}

void addCommands(Command& program, Admin& admin) {
    addAliasesCommand(program, admin);
    addApplyCommand(program, admin);
    addBackupCommand(program, admin);
    addCheckCommand(program, admin);
    addCommitCommand(program, admin);
    addCompletionCommand(program, admin);
    addCopiesCommand(program, admin);
    addDiffCommand(program, admin);
    addEnsureCommand(program, admin);
    addExplainCommand(program, admin);
    addExportCommand(program, admin);
    addFactsCommand(program, admin);
    addFrontCommand(program, admin);
    addHistoryCommand(program, admin);
    addImportCommand(program, admin);
    addRepairCommand(program, admin);
    addReportCommand(program, admin);
    addResolveCommand(program, admin);
    addRestoreCommand(program, admin);
    addTreeCommand(program, admin);
    addUndoCommand(program, admin);
}

int run(Admin& admin, int argc, char** argv) {
    admin.arguments.assign(argv + (argc == 0 ? 0 : 1), argv + argc);
    CLI::App program("Inspects and changes the registry data that kz7InstallReg writes", "kz7admin");
    Command command(program);
    command.text("--store", admin.storeDirectory, "The state directory to use instead of the usual one").isFileName();
    program.add_option("--at-least", "Do nothing if this program is older")->check(notOlder())->type_name("VERSION");
    program.set_version_flag("--version", "kz7admin " KZ7_VERSION, "Print the version");
    program.footer(kFooter);
    program.get_formatter()->column_width(24);  // help fits 80 columns
    program.fallthrough();
    addCommands(command, admin);
    try {
        program.parse(argc, argv);
    } catch (const CLI::Success& help) {
        return showHelp(program, help);
    } catch (const CLI::ExtrasError&) {
        admin.isJson = asksForJson(admin.arguments);
        return admin.fault("unexpected argument: " + shownText(program.remaining(true).front()) + " (see --help)");
    } catch (const CLI::ParseError& error) {
        admin.isJson = asksForJson(admin.arguments);
        return admin.fault(shownText(error.what()) + " (see --help)");
    }
    if (admin.answer == nullptr) {
        return admin.fault("no command (see --help)");
    }
    const int answer = admin.answer();
    admin.endRun(answer);
    return answer;
}

}  // namespace
}  // namespace kz7

int kz7::programMain(int argc, char** argv) {
    // What was not committed is dropped with the platform.
    Admin admin;
    try {
        const int answer = run(admin, argc, argv);
        admin.endErrors(answer);
        return answer;
    } catch (const std::bad_alloc&) {
        std::fputs(
            admin.isJson ? "{\"schema\":1,\"error\":\"out of memory\",\"exitCode\":2}\n" : "kz7admin: out of memory\n",
            stderr);
    } catch (const std::exception& error) {
        admin.tell(shownText(error.what()));
        admin.endErrors(kAnswerFault);
    }
    return kAnswerFault;
}
