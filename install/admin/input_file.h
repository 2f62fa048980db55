// Files that a person names on the command line.
#pragma once

#include <string>

namespace kz7 {

// The whole of a file, or of standard input for "-"; 0 or the error of the call that failed.
int readInput(const std::string& path, std::string& bytes);

}  // namespace kz7
