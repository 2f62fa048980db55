// The command line of a program that is given as words.
#pragma once

#include <string>
#include <vector>

namespace kz7 {

// The command line that the started program splits into these words, the program first.
std::string joinArguments(const std::vector<std::string>& words);

// Whether these words reach the program unchanged. The command interpreter that runs a batch file interprets
// quotation marks, percent signs, line ends and other control characters before the file gets them.
bool canPassWords(const std::vector<std::string>& words);

}  // namespace kz7
