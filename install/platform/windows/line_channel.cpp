#include "install/platform/windows/terminal.h"

#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <cstdio>
#include <string>

#include "install/platform/encoding.h"

namespace kz7 {

Status WindowsTerminal::readLine(Buffer& line) {
    reader_ = GetCurrentThreadId();
    std::string room(line.capacity, '\0');
    Buffer narrow(room.data(), line.capacity, line.limit);
    const Status status = ended_ ? kOperationAborted : readLineOf([] { return std::getc(stdin); }, narrow);
    reader_ = 0;
    if (status == kSuccess) {
        const std::string text = textFromNarrow(narrow.view());
        line.size = static_cast<std::uint32_t>(cutText(text, line.limit).copy(line.data, line.capacity));
    }
    return ended_ ? kOperationAborted : status;
}

void WindowsTerminal::endReading() {
    constexpr int kAttempts = 50;
    constexpr DWORD kInterval = 20;  // milliseconds
    ended_ = true;
    // The reader may not wait yet at the first attempt.
    for (int attempt = 0; attempt < kAttempts && reader_ != 0; ++attempt) {
        if (const HANDLE reader = OpenThread(THREAD_TERMINATE, FALSE, reader_); reader != nullptr) {
            CancelSynchronousIo(reader);
            CloseHandle(reader);
        }
        Sleep(kInterval);
    }
}

void WindowsTerminal::keepLineFeeds(bool on) {
    std::fflush(stdout);
    if (on) {
        modeBefore_ = _setmode(_fileno(stdout), _O_BINARY);
    } else if (modeBefore_ != -1) {
        _setmode(_fileno(stdout), modeBefore_);
    }
}

}  // namespace kz7
