#include <sys/ioctl.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <string_view>

#include "install/platform/embedded/ports.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kUsualColumns = 80;

std::string_view environment(const char* name) {
    const char* value = std::getenv(name);
    return value == nullptr ? std::string_view{} : value;
}

class EmbeddedTerminal final : public ITerminal {
public:
    Status readLine(Buffer& line) override { return readStandardLine(line); }

    // Line feeds are one byte here in any case.
    void keepLineFeeds(bool) override {}

    TerminalView look(TerminalStream stream) override {
        const int descriptor = stream == TerminalStream::input    ? STDIN_FILENO
                               : stream == TerminalStream::output ? STDOUT_FILENO
                                                                  : STDERR_FILENO;
        TerminalView view;
        view.terminal = isatty(descriptor) == 1;
        if (view.terminal) {
            winsize size{};
            const bool known = ioctl(descriptor, TIOCGWINSZ, &size) == 0 && size.ws_col != 0;
            view.columns = known ? size.ws_col : kUsualColumns;
            const std::string_view kind = environment("TERM");
            view.redraws = !kind.empty() && kind != "dumb";
            view.colours = view.redraws && environment("NO_COLOR").empty();
        }
        return view;
    }

    // Caught rather than ignored: an ignored signal stays ignored in the programs that this one starts.
    void leaveInterruptsToOthers(bool on) override {
        struct sigaction action {};
        action.sa_handler = on ? [](int) {} : SIG_DFL;
        action.sa_flags = SA_RESTART;
        sigaction(SIGINT, &action, nullptr);
    }
};

}  // namespace

std::unique_ptr<ITerminal> embeddedTerminal() {
    return std::make_unique<EmbeddedTerminal>();
}

}  // namespace kz7
