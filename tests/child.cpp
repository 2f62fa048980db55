// A program for the tests of process execution: each mode is one thing that a child may do
// to its parent.
#include <cstdio>
#include <string>

#include "tests/support/gate.h"

using namespace kz7::test;

// Writes to both streams in turn until a write fails or all is written.
static bool flood(long pieces) {
    const std::string piece(std::size_t{64} * 1024, 'x');
    for (long written = 0; written != pieces; ++written) {
        if (std::fwrite(piece.data(), 1, piece.size(), stdout) != piece.size() ||
            std::fwrite(piece.data(), 1, piece.size(), stderr) != piece.size()) {
            return false;
        }
    }
    return std::fflush(stdout) == 0;
}

int main(int argc, char** argv) {
    const std::string mode = argc > 1 ? argv[1] : "";
    const char* first = argc > 2 ? argv[2] : "";
    const int code = argc > 3 ? std::atoi(argv[argc - 1]) : 0;
    if (mode == "print") {  // OUTPUT ERROR CODE
        std::fputs(first, stdout);
        std::fputs(argv[3], stderr);
        return code;
    }
    if (mode == "arguments") {
        for (int i = 2; i < argc; ++i) {
            std::printf("[%s]", argv[i]);
        }
        return 0;
    }
    if (mode == "flood") {  // MIB CODE; 0 MIB: until nobody reads
        return flood(std::atoi(first) == 0 ? -1 : 16L * std::atoi(first)) ? code : 1;
    }
    if (mode == "input") {  // counts what it can read
        long count = 0;
        while (std::getchar() != EOF) {
            ++count;
        }
        std::printf("%ld bytes of input", count);
        return 0;
    }
    if (mode == "close") {  // GATE CODE: closes its output, then runs on to the gate
        std::fclose(stdout);
        std::fclose(stderr);
        waitAtGate(first);
        return code;
    }
    if (mode == "gate") {  // GATE CODE
        waitAtGate(first);
        std::fputs(" and after", stdout);
        return code;
    }
    if (mode == "leave") {  // GATE: leaves its pipes to a program that waits at the gate
        std::fputs("before", stdout);
        std::fflush(stdout);
        return startInheriting(argv[0], "gate", first) ? 3 : 1;
    }
    return 99;
}
