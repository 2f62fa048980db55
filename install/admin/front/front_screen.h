// The display of an installer program's progress: on a terminal one bar for each phase, redrawn in place, with all
// other lines above it; elsewhere plain lines.
#pragma once

#include <mutex>
#include <string>
#include <string_view>

#include "install/platform/console.h"
#include "install/platform/terminal.h"

namespace kz7 {

// Texts are shown with control characters escaped. May be called from several threads.
class FrontScreen {
public:
    FrontScreen(IConsole& console, ITerminal& terminal) : console_(console), terminal_(terminal) {}

    struct Bar {
        std::string_view phase;
        int percent = -1;  // below 0: unknown
        std::string_view text;
        std::string_view time = {};  // elapsed and left; in drawn bars only
    };

    // Begins a bar, or redraws the current one. Without a terminal it is a line.
    void showBar(const Bar& bar);

    // Redraws the current bar with another time.
    void showTime(std::string_view time);

    // Ends the current bar: the next one begins on a new line.
    void leaveBar();

    void showLine(std::string_view text);       // on standard output
    void showErrorLine(std::string_view text);  // on standard error
    void showFailure(std::string_view text);    // the same, so that it is seen

    // Shows a question with a prompt, without a line feed at the end.
    void showQuestion(std::string_view text, std::string_view prompt);

    // Shows an answer that was not typed on the terminal.
    void showAnswer(std::string_view text);

private:
    bool draws() const { return terminal_.look(TerminalStream::output).redraws; }
    void above(std::string_view text, bool isError, std::string_view colour);
    void draw();
    void wipe();

    IConsole& console_;
    ITerminal& terminal_;
    std::mutex lock_;
    std::string phase_;
    std::string barText_;
    std::string time_;
    int percent_ = -1;
    bool hasBar_ = false;
};

// The line of a bar in that many columns, and no more.
std::string barLine(const FrontScreen::Bar& bar, std::uint32_t columns);

}  // namespace kz7
