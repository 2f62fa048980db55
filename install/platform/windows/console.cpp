#include "install/platform/windows/ports.h"

#include <io.h>
#include <windows.h>

#include <algorithm>
#include <cstdio>

#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

constexpr std::size_t kPiece = 8192;  // UTF-16 units of one call

// The handle of a stream that is a console; null for any other.
HANDLE consoleOf(std::FILE* stream) {
    if (_isatty(_fileno(stream)) == 0) {
        return nullptr;
    }
    const auto handle = reinterpret_cast<HANDLE>(_get_osfhandle(_fileno(stream)));
    DWORD mode = 0;
    return GetConsoleMode(handle, &mode) != FALSE ? handle : nullptr;
}

Status writeToConsole(std::FILE* stream, HANDLE console, std::string_view text) {
    std::fflush(stream);
    const WideText wide(text);
    for (std::size_t at = 0, length = 0; at < wide.size(); at += length) {
        length = std::min(wide.size() - at, kPiece);
        if (length == kPiece && IS_HIGH_SURROGATE(wide.c_str()[at + length - 1])) {
            --length;  // a pair stays together
        }
        DWORD written = 0;
        if (WriteConsoleW(console, wide.c_str() + at, static_cast<DWORD>(length), &written, nullptr) == FALSE) {
            return kWriteFault;
        }
    }
    return kSuccess;
}

// The C library's streams. A console gets Unicode, files and pipes get the active code page.
class WindowsConsole final : public IConsole {
public:
    Status writeOutput(std::string_view text) override {
        const HANDLE console = consoleOf(stdout);
        return console != nullptr ? writeToConsole(stdout, console, text) : streams_->writeOutput(narrowFromText(text));
    }

    Status writeError(std::string_view text) override {
        flush();
        const HANDLE console = consoleOf(stderr);
        return console != nullptr ? writeToConsole(stderr, console, text) : streams_->writeError(narrowFromText(text));
    }

    Status writeDocument(std::string_view text) override {
        const HANDLE console = consoleOf(stdout);
        return console != nullptr ? writeToConsole(stdout, console, text) : streams_->writeOutput(text);
    }

    Status flush() override { return streams_->flush(); }

private:
    std::unique_ptr<IConsole> streams_ = standardConsole();
};

}  // namespace

std::unique_ptr<IConsole> windowsConsole() {
    return std::make_unique<WindowsConsole>();
}

}  // namespace kz7
