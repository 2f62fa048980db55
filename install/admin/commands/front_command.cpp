#include <memory>

#include "install/admin/commands/commands.h"
#include "install/admin/front/command_words.h"
#include "install/admin/front/front.h"
#include "install/platform/command_line.h"
#include "install/platform/memory/small_ports.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr int kNotStarted = 127;  // as in shells; all other codes are the program's

struct FrontOptions {
    std::vector<std::string> words;  // the program and its arguments
};

// The exit code, which may be any number.
int runProgram(Admin& admin, const FrontOptions& options) {
    const std::vector<std::string>& command = options.words;
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    if (!canPassWords(command)) {
        admin.tell(shownText(command.front()) +
                   ": a batch file is given no argument with a quotation mark, a percent sign or a control character");
        return kNotStarted;
    }
    IPlatform& platform = admin.platform();
    MemoryConsole kept;
    const FrontPorts ports{platform.processes(), platform.threads(), platform.files(), platform.terminal(),
                           admin.isJson ? static_cast<IConsole&>(kept) : platform.console()};
    std::uint32_t exitCode = 0;
    const Status status = runFront(ports, command, exitCode);
    if (admin.isJson && status == kSuccess) {
        JsonWriter json = beginDocument();
        admin.writeJson(json.field("exitCode", exitCode).field("output", kept.output));
    }
    if (status == kSuccess) {
        return static_cast<int>(exitCode);
    }
    const std::string program = shownText(command.front());
    if (isNotFound(status)) {
        const char* const hint = isBareName(command.front()) ? "" : " (a path must be absolute)";
        admin.tell("no such program: " + program + hint);
    } else {
        admin.tell(compose("cannot run program: %s: error %u", {program, status}));
    }
    return kNotStarted;
}

}  // namespace

void addFrontCommand(Command& program, Admin& admin) {
    auto command = program.add("front", "Run an installer program and show its progress");
    auto& options = command.answerWith(admin, runProgram);
    command.texts("PROGRAM", options.words, "The program and its arguments, best after --").isRequired();
    command.endsWithArguments();
    command.json(admin, "Write the result as JSON, show no progress");
}

}  // namespace kz7
