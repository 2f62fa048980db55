// A program for the tests of process execution: each of its modes is one thing that a started program may do
// to whoever started it.
#include <cstdio>
#include <cstdlib>
#include <string>

#include "tests/support/gate.h"

namespace {

using namespace kz7::test;

int number(const char* text) {
    return std::atoi(text);
}

// Writes to both streams in turn until a write fails or all is written.
bool flood(long pieces) {
    const std::string piece(64 * 1024, 'x');
    for (long written = 0; written != pieces; ++written) {
        if (std::fwrite(piece.data(), 1, piece.size(), stdout) != piece.size() ||
            std::fwrite(piece.data(), 1, piece.size(), stderr) != piece.size()) {
            return false;
        }
    }
    return std::fflush(stdout) == 0;
}

}  // namespace

int main(int argc, char** argv) {
    const std::string mode = argc > 1 ? argv[1] : "";
    const char* first = argc > 2 ? argv[2] : "";
    const char* second = argc > 3 ? argv[3] : "";
    if (mode == "print") {  // OUTPUT ERROR CODE
        std::fputs(first, stdout);
        std::fputs(second, stderr);
        return number(argc > 4 ? argv[4] : "0");
    }
    if (mode == "arguments") {
        for (int i = 2; i < argc; ++i) {
            std::printf("[%s]", argv[i]);
        }
        return 0;
    }
    if (mode == "flood") {  // MIB CODE; 0 MIB: until nobody reads
        return flood(number(first) == 0 ? -1 : 16L * number(first)) ? number(second) : 1;
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
        closeStandardStreams();
        waitAtGate(first);
        return number(second);
    }
    if (mode == "gate") {  // GATE CODE
        waitAtGate(first);
        std::fputs(" and after", stdout);
        return number(second);
    }
    if (mode == "leave") {  // GATE: leaves its pipes to a program that waits at the gate
        std::fputs("before", stdout);
        std::fflush(stdout);
        return startInheriting(argv[0], "gate", first) ? 3 : 1;
    }
    return 99;
}
