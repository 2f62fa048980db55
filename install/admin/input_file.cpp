#include "install/admin/input_file.h"

#include <cerrno>
#include <cstdio>
#include <cstring>

#include "install/platform/program.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::size_t kLongest = std::size_t{1} << 30;  // bytes, so that an endless file does not take all memory

// 0 or an error number.
int readInput(const std::string& path, std::string& bytes) {
    std::FILE* file = path == "-" ? stdin : openInput(path.c_str());
    if (file == nullptr) {
        return errno;
    }
    char piece[1 << 14];
    errno = 0;
    for (std::size_t size = 0; bytes.size() <= kLongest && (size = std::fread(piece, 1, sizeof piece, file)) != 0;) {
        bytes.append(piece, size);
    }
    const int error = bytes.size() > kLongest ? EFBIG : std::ferror(file) == 0 ? 0 : errno;
    if (file != stdin) {
        std::fclose(file);
    }
    return error;
}

}  // namespace

InputFile::InputFile(Admin& admin, const std::string& path)
    : admin_(admin), path_(path), shown_(path == "-" ? "standard input" : shownText(path)) {}

Answer InputFile::read() {
    const int error = readInput(path_, bytes_);
    return error == 0 ? kAnswerYes : admin_.fault(shown_ + ": " + std::strerror(error));
}

Answer InputFile::badLine(std::uint32_t line, std::string_view reason) {
    return admin_.fault(compose("%s:%u: %s", {shown_, line, reason}));
}

}  // namespace kz7
