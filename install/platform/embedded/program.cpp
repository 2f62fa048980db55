#include "install/platform/program.h"

namespace kz7 {

std::FILE* openInput(const char* path) {
    return std::fopen(path, "rb");
}

}  // namespace kz7

int main(int argc, char** argv) {
    return kz7::programMain(argc, argv);
}
