#include "install/platform/command_line.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kBlanks = " \t";

constexpr bool isBlank(char c) {
    return c == ' ' || c == '\t';
}

// Neither a splitter nor a command interpreter acts upon any character of such a word.
bool isPlain(std::string_view word) {
    constexpr std::string_view kPlain = "-_./\\:+@";
    return !word.empty() && std::all_of(word.begin(), word.end(), [&](char c) {
        const char letter = static_cast<char>(c | 0x20);
        return (c >= '0' && c <= '9') || (letter >= 'a' && letter <= 'z') || kPlain.find(c) != std::string_view::npos;
    });
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

std::string joinArguments(const std::vector<std::string>& words) {
    std::string line;
    for (const std::string& word : words) {
        // The word of the program ends at its closing quotation mark, even after a backslash.
        if (line.empty()) {
            line += '"' + word + '"';
            continue;
        }
        // Command interpreters know their options without quotation marks only.
        if (isPlain(word)) {
            line += ' ' + word;
            continue;
        }
        line += " \"";
        std::size_t backslashes = 0;
        for (const char c : word) {
            if (c == '"') {
                line.append(backslashes + 1, '\\');
            }
            backslashes = c == '\\' ? backslashes + 1 : 0;
            line += c;
        }
        line.append(backslashes, '\\');
        line += '"';
    }
    return line;
}

bool canPassWords(const std::vector<std::string>& words) {
    // The system passes over blanks and dots at the end of a file's name.
    const std::string_view program(words.front());
    const std::string_view file = program.substr(0, program.find_last_not_of(". ") + 1);
    const std::string_view ending = file.substr(file.size() - std::min<std::size_t>(file.size(), 4));
    const auto isActedUpon = [](char c) { return c == '"' || c == '%' || (c >= 0 && c < ' ') || c == 0x7F; };
    return (!equalsIgnoreCase(ending, ".bat") && !equalsIgnoreCase(ending, ".cmd")) ||
           std::none_of(words.begin(), words.end(),
                        [&](const std::string& word) { return std::any_of(word.begin(), word.end(), isActedUpon); });
}

bool isBareName(std::string_view program) {
    return program.find_first_of("/\\:") == std::string_view::npos;
}

}  // namespace kz7
