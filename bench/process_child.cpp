// The child of the process benchmarks: `process_child MIB` writes that much; without an argument it ends at once.
#include <unistd.h>

#include <cstdlib>

int main(int argc, char** argv) {
    static char piece[64 * 1024];
    for (long left = argc > 1 ? 16 * std::atol(argv[1]) : 0; left != 0; --left) {
        if (write(STDOUT_FILENO, piece, sizeof piece) != sizeof piece) {
            return 1;
        }
    }
    return 0;
}
