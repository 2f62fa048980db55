// The front end shows any output of a program, in pieces of any size, and no control character reaches the terminal.
#include "fuzz/fuzzer.h"
#include "install/admin/front/front.h"
#include "install/platform/memory/platform.h"

static std::string shown(std::string_view input, std::size_t piece, bool onTerminal) {
    kz7::MemoryPlatform machine;
    if (onTerminal) {
        machine.terminal_.view = {.terminal = true, .redraws = true, .colours = false, .columns = 30};
    }
    const kz7::FrontPorts ports{machine.processes_, machine.threads_, machine.files_, machine.terminal_,
                                machine.console_};
    kz7::FrontScreen screen(machine.console_, machine.terminal_);
    kz7::FrontView view(ports, screen);
    kz7::LineCutter cutter;
    const auto take = [&](std::string_view line) {
        view.takeLine(line, [](std::string_view answer) { check(answer == "ABORT\n"); });
    };
    for (std::size_t at = 0; at < input.size(); at += piece) {
        cutter.add(input.substr(at, piece), take);
    }
    cutter.end(take);
    view.end("program", 1);
    return machine.console_.both;
}

void tryInput(std::string_view input) {
    const std::string whole = shown(input, input.size() + 1, false);
    check(whole == shown(input, 3, false));
    for (const char c : whole) {
        check(c == '\n' || static_cast<unsigned char>(c) >= 0x20);
    }
    const std::string drawn = shown(input, 7, true);
    for (std::size_t at = drawn.find('\x1b'); at != std::string::npos; at = drawn.find('\x1b', at + 1)) {
        check(drawn.compare(at, 3, "\x1b[K") == 0);
    }
}
