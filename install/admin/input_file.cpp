#include "install/admin/input_file.h"

#include <cerrno>
#include <cstdio>

namespace kz7 {

int readInput(const std::string& path, std::string& bytes) {
    std::FILE* file = path == "-" ? stdin : std::fopen(path.c_str(), "rb");
    if (file == nullptr) {
        return errno;
    }
    char piece[1 << 14];
    errno = 0;
    for (std::size_t size = 0; (size = std::fread(piece, 1, sizeof piece, file)) != 0;) {
        bytes.append(piece, size);
    }
    const int error = std::ferror(file) == 0 ? 0 : errno;
    if (file != stdin) {
        std::fclose(file);
    }
    return error;
}

}  // namespace kz7
