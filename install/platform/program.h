// What the main file of a program needs from the host.
#pragma once

#include <cstdio>

namespace kz7 {

// Defined by each program. The arguments are texts as the ports take them.
int programMain(int argc, char** argv);

// Opens a file of the command line for reading bytes; a relative path starts in the current directory. Null on failure,
// with errno.
std::FILE* openInput(const char* path);

}  // namespace kz7
