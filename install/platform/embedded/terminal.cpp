#include <poll.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <cerrno>
#include <charconv>
#include <csignal>
#include <cstdio>
#include <string>

#include "install/platform/embedded/ports.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kUsualColumns = 80;
constexpr int kPollInterval = 100;  // milliseconds between two checks of endReading()

// $COLUMNS, which overrides the terminal, or the width of its window.
std::uint32_t columnsOf(int descriptor) {
    const std::string named = environmentText("COLUMNS");
    std::uint32_t columns = 0;
    if (std::from_chars(named.data(), named.data() + named.size(), columns).ec == std::errc{} && columns != 0) {
        return columns;
    }
    winsize size{};
    return ioctl(descriptor, TIOCGWINSZ, &size) == 0 && size.ws_col != 0 ? size.ws_col : kUsualColumns;
}

class EmbeddedTerminal final : public ITerminal {
public:
    Status readLine(Buffer& line) override {
        const Status status = readLineOf([this] { return nextByte(); }, line);
        return ended_ ? kOperationAborted : status;
    }

    void endReading() override { ended_ = true; }

    // A line feed is one byte on POSIX.
    void keepLineFeeds(bool) override {}

    TerminalView look(TerminalStream stream) override {
        const int descriptor = stream == TerminalStream::input    ? STDIN_FILENO
                               : stream == TerminalStream::output ? STDOUT_FILENO
                                                                  : STDERR_FILENO;
        TerminalView view;
        view.terminal = isatty(descriptor) == 1;
        if (view.terminal) {
            view.columns = columnsOf(descriptor);
            const std::string kind = environmentText("TERM");
            view.redraws = !kind.empty() && kind != "dumb";
            view.colours = view.redraws && environmentText("NO_COLOR").empty();
        }
        return view;
    }

    // A handler instead of SIG_IGN: child programs would inherit an ignored signal.
    void leaveInterruptsToOthers(bool on) override {
        struct sigaction action {};
        sigaction(SIGINT, nullptr, &action);
        if (action.sa_handler == SIG_IGN) {
            return;
        }
        action = {};
        action.sa_handler = on ? [](int) {} : SIG_DFL;
        action.sa_flags = SA_RESTART;
        sigaction(SIGINT, &action, nullptr);
    }

private:
    int nextByte() {
        pollfd input{STDIN_FILENO, POLLIN, 0};
        while (at_ == end_) {
            int ready = 0;
            while (!ended_ && ready <= 0) {
                ready = poll(&input, 1, kPollInterval);
            }
            const ssize_t count = ended_ ? 0 : read(STDIN_FILENO, bytes_.data(), bytes_.size());
            if (count == 0 || (count == -1 && errno != EINTR && errno != EAGAIN)) {
                return EOF;
            }
            at_ = 0;
            end_ = count > 0 ? static_cast<std::size_t>(count) : 0;
        }
        return bytes_[at_++];
    }

    // Does not use the C library's buffer: poll() must know whether a read would wait.
    std::array<unsigned char, 4096> bytes_;
    std::size_t at_ = 0;
    std::size_t end_ = 0;
    std::atomic<bool> ended_ = false;
};

}  // namespace

std::unique_ptr<ITerminal> embeddedTerminal() {
    return std::make_unique<EmbeddedTerminal>();
}

}  // namespace kz7
