// Command lines as the platform's process creation and the C runtime of a started program read them. On
// Windows the system does this itself.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace kz7 {

// One way to read a command line; the texts are parts of it.
struct CommandReading {
    std::string_view program;
    std::string_view arguments;
};

// The ways to read it, in the order they are tried. A program in quotes has one; without quotes the program
// ends at the first blank, or at the second, and so on to the end. None for a command line of blanks.
std::vector<CommandReading> commandReadings(std::string_view commandLine);

// Splits at blanks and tabs outside quotes. 2n backslashes and a quote are n backslashes and a quote that
// groups, one more backslash makes the quote a literal one; two quotes inside quotes are a literal one.
std::vector<std::string> splitArguments(std::string_view arguments);

// The command line that splits into these words, the program first.
std::string joinArguments(const std::vector<std::string>& words);

// Whether these words reach the program as they are. A batch file is run by a command interpreter, which acts upon
// quotation marks, percent signs, line ends and other control characters before the file sees them.
bool canPassWords(const std::vector<std::string>& words);

// A name without folder or drive, to be searched for.
bool isBareName(std::string_view program);

}  // namespace kz7
