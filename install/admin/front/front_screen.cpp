#include "install/admin/front/front_screen.h"

#include <algorithm>

#include "install/platform/text.h"
#include "install/runtime/observers/text_columns.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kPhaseColumns = 13;
constexpr std::uint32_t kPercentColumns = 6;  // " 100% "
constexpr std::uint32_t kMinBar = 10;
constexpr std::uint32_t kMaxBar = 40;
constexpr std::uint32_t kMinText = 30;

constexpr std::string_view kRed = "\x1b[31m";
constexpr std::string_view kPlain = "\x1b[0m";
constexpr std::string_view kWipeLine = "\r\x1b[K";

// For people, broken between words; on one line where nobody looks.
std::string wrapped(std::string_view text, std::uint32_t columns) {
    std::string lines;
    do {
        lines.append(takeWrappedLine(text, columns)).append("\n");
    } while (!text.empty());
    return lines;
}

std::string cutToColumns(std::string_view text, std::uint32_t columns) {
    std::string_view rest = text;
    std::uint32_t used = 0;
    for (std::string_view next = text; !next.empty() && (used += takeColumns(next)) <= columns;) {
        rest = next;
    }
    return std::string(text.substr(0, text.size() - rest.size()));
}

std::string plainLine(const FrontScreen::Bar& bar) {
    std::string line(bar.phase);
    if (bar.percent >= 0) {
        line += ' ' + std::to_string(bar.percent) + '%';
    }
    return bar.text.empty() ? line : line + ": " + std::string(bar.text);
}

}  // namespace

std::string barLine(const FrontScreen::Bar& bar, std::uint32_t columns) {
    std::string line = cutToColumns(bar.phase, kPhaseColumns - 1);
    line.resize(kPhaseColumns, ' ');
    const std::string text = std::string(bar.time) + (bar.time.empty() ? "" : " ") + std::string(bar.text);
    if (bar.percent < 0) {
        return cutToColumns(line.append(text), columns);
    }
    if (columns < kPhaseColumns + kMinBar + 2 + kPercentColumns) {
        return cutToColumns(plainLine(bar), columns);
    }
    const std::uint32_t rest = columns - kPhaseColumns - 2 - kPercentColumns;
    const std::uint32_t width = std::clamp(rest > kMinText ? rest - kMinText : 0, kMinBar, kMaxBar);
    const auto percent = static_cast<std::uint32_t>(bar.percent);
    const std::uint32_t filled = width * percent / 100;
    line += '[' + std::string(filled, '#') + std::string(width - filled, '.') + ']';
    const std::string number = std::to_string(percent) + '%';
    line += std::string(kPercentColumns - 1 - number.size(), ' ') + number + ' ';
    line += cutToColumns(text, rest - width);
    return line;
}

void FrontScreen::showBar(const Bar& bar) {
    const std::lock_guard<std::mutex> held(lock_);
    phase_ = shownText(bar.phase);
    barText_ = shownText(bar.text);
    percent_ = bar.percent;
    time_ = bar.time;
    if (draws()) {
        draw();
        return;
    }
    console_.writeOutput(plainLine({phase_, percent_, barText_}) + '\n');
    console_.flush();
}

void FrontScreen::draw() {
    // The last column stays free: some terminals go to the next line there.
    const std::uint32_t columns = terminal_.look(TerminalStream::output).columns;
    console_.writeOutput(kWipeLine);
    console_.writeOutput(barLine({phase_, percent_, barText_, time_}, columns > 1 ? columns - 1 : 1));
    console_.flush();
    hasBar_ = true;
}

void FrontScreen::showTime(std::string_view time) {
    const std::lock_guard<std::mutex> held(lock_);
    if (hasBar_) {
        time_ = time;
        draw();
    }
}

void FrontScreen::wipe() {
    if (hasBar_) {
        console_.writeOutput(kWipeLine);
        console_.flush();
    }
}

void FrontScreen::leaveBar() {
    const std::lock_guard<std::mutex> held(lock_);
    if (hasBar_) {
        console_.writeOutput("\n");
        console_.flush();
        hasBar_ = false;
    }
}

void FrontScreen::above(std::string_view text, bool isError, std::string_view colour) {
    const std::lock_guard<std::mutex> held(lock_);
    wipe();
    const TerminalView view = terminal_.look(isError ? TerminalStream::error : TerminalStream::output);
    std::string line = wrapped(shownText(text), view.columns);
    if (!colour.empty() && view.colours) {
        line = std::string(colour) + line + std::string(kPlain);
    }
    if (isError) {
        console_.writeError(line);
    } else {
        console_.writeOutput(line);
        console_.flush();
    }
    if (hasBar_) {
        draw();
    }
}

void FrontScreen::showLine(std::string_view text) {
    above(text, false, {});
}

void FrontScreen::showErrorLine(std::string_view text) {
    above(text, true, {});
}

void FrontScreen::showFailure(std::string_view text) {
    above(text, true, kRed);
}

void FrontScreen::showQuestion(std::string_view text, std::string_view prompt) {
    const std::lock_guard<std::mutex> held(lock_);
    wipe();
    hasBar_ = false;
    const std::uint32_t columns = terminal_.look(TerminalStream::output).columns;
    console_.writeOutput(wrapped(shownText(text), columns) + shownText(prompt));
    console_.flush();
}

void FrontScreen::showAnswer(std::string_view text) {
    const std::lock_guard<std::mutex> held(lock_);
    console_.writeOutput(shownText(text) + '\n');
    console_.flush();
}

}  // namespace kz7
