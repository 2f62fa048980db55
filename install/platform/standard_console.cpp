#include "install/platform/standard_console.h"

#include <cerrno>
#include <cstdio>

namespace kz7 {
namespace {

Status lastStatus() {
    return errno == EPIPE ? kPipeClosing : errno == ENOSPC ? kDiskFull : kWriteFault;
}

Status write(std::FILE* stream, std::string_view text) {
    return std::fwrite(text.data(), 1, text.size(), stream) == text.size() ? kSuccess : lastStatus();
}

}  // namespace

Status StandardConsole::writeOutput(std::string_view text) {
    return write(stdout, text);
}

Status StandardConsole::writeError(std::string_view text) {
    flush();
    const Status status = write(stderr, text);
    // Some hosts buffer this stream too, once it is led into a file.
    return std::fflush(stderr) == 0 ? status : kWriteFault;
}

Status StandardConsole::flush() {
    return std::fflush(stdout) == 0 ? kSuccess : lastStatus();
}

}  // namespace kz7
