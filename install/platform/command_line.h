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

// The ways to read a command line, in the order in which they are tried. A program in quotation marks has one;
// without them the program ends at the first blank, or at the second, and so on. Empty for a line of blanks.
std::vector<CommandReading> commandReadings(std::string_view commandLine);

// Splits at blanks and tabs outside quotation marks. 2n backslashes before a quotation mark are n backslashes, and the
// mark begins or ends a quotation; 2n+1 are n backslashes and a literal mark. Two marks inside a quotation are a
// literal one.
std::vector<std::string> splitArguments(std::string_view arguments);

// Whether a program is a name without folder or drive, which is searched for.
bool isBareName(std::string_view program);

}  // namespace kz7
