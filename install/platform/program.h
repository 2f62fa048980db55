// What the main file of a program needs of the host.
#pragma once

#include <cstdio>
#include <string>

namespace kz7 {

// Defined by each program. The arguments are texts as the ports take them.
int programMain(int argc, char** argv);

// Opens a file that a person names, to read its bytes; a relative path begins in the current folder. Null on failure,
// with errno.
std::FILE* openInput(const char* path);

// A variable of the environment as a text of the ports; empty if it is not set.
std::string environmentText(const char* name);

}  // namespace kz7
