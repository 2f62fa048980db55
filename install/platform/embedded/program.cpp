#include "install/platform/program.h"

#include <cstdlib>

namespace kz7 {

std::FILE* openInput(const char* path) {
    return std::fopen(path, "rb");
}

std::string environmentText(const char* name) {
    const char* const value = std::getenv(name);
    return value == nullptr ? std::string{} : value;
}

}  // namespace kz7

int main(int argc, char** argv) {
    return kz7::programMain(argc, argv);
}
