#include "install/platform/command_line.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kBlanks = " \t";

constexpr bool isBlank(char c) {
    return c == ' ' || c == '\t';
}

std::size_t takeBackslashes(std::string_view& text) {
    const std::size_t count = std::min(text.find_first_not_of('\\'), text.size());
    text.remove_prefix(count);
    return count;
}

// Takes a quotation mark and appends it if it is a literal one: after an odd number of backslashes, or doubled inside
// quotation marks. Otherwise it begins or ends a quotation.
void takeMark(bool isEscaped, std::string_view& text, bool& quoted, std::string& argument) {
    text.remove_prefix(1);
    const bool isDoubled = !isEscaped && quoted && text.starts_with('"');
    if (isEscaped || isDoubled) {
        argument += '"';
        text.remove_prefix(isDoubled ? 1 : 0);
    } else {
        quoted = !quoted;
    }
}

// Takes one argument off `text`, which does not begin with a blank.
std::string takeArgument(std::string_view& text) {
    std::string argument;
    bool quoted = false;
    while (!text.empty() && (quoted || !isBlank(text.front()))) {
        const std::size_t backslashes = takeBackslashes(text);
        if (text.starts_with('"')) {
            argument.append(backslashes / 2, '\\');
            takeMark(backslashes % 2 != 0, text, quoted, argument);
        } else if (backslashes != 0) {
            argument.append(backslashes, '\\');
        } else {
            argument += text.front();
            text.remove_prefix(1);
        }
    }
    return argument;
}

}  // namespace

std::vector<CommandReading> commandReadings(std::string_view commandLine) {
    const std::size_t begin = commandLine.find_first_not_of(kBlanks);
    if (begin == std::string_view::npos) {
        return {};
    }
    const std::string_view line = commandLine.substr(begin);
    const auto readingTo = [line](std::size_t programEnd, std::size_t argumentsBegin) {
        return CommandReading{line.substr(0, programEnd),
                              argumentsBegin < line.size() ? line.substr(argumentsBegin) : std::string_view{}};
    };
    if (line.front() == '"') {
        const std::size_t close = line.find('"', 1);
        CommandReading reading = readingTo(close, line.find_first_of(kBlanks, close));
        reading.program.remove_prefix(1);
        return {reading};
    }
    std::vector<CommandReading> readings;
    for (std::size_t end = 0; end < line.size();) {
        end = line.find_first_of(kBlanks, end);
        readings.push_back(readingTo(end, end));
        end = line.find_first_not_of(kBlanks, end);
    }
    return readings;
}

std::vector<std::string> splitArguments(std::string_view arguments) {
    std::vector<std::string> split;
    for (;;) {
        const std::size_t begin = arguments.find_first_not_of(kBlanks);
        if (begin == std::string_view::npos) {
            return split;
        }
        arguments.remove_prefix(begin);
        split.push_back(takeArgument(arguments));
    }
}

bool isBareName(std::string_view program) {
    return program.find_first_of("/\\:") == std::string_view::npos;
}

}  // namespace kz7
