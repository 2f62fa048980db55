// The log of a run: every info as a line, in a file or, without one, in the installer session's own log.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "install/platform/file_system.h"
#include "install/runtime/observers/kz7iobs.h"
#include "install/runtime/ure.h"

namespace kz7 {

inline constexpr std::string_view kLogFileName = "kz7msi.log";
inline constexpr std::size_t kPathSize = 261;  // bytes of a file path with its terminator

// One per process. Register it with Takes::everything, after setLogFile(). Lines go to the session until a
// file is open. The engine outlives it.
class URELogObserver final : public IObserver {
public:
    // Makes it on the first request. Null: no memory.
    static URELogObserver* getInstance(URE& ure);
    static void release();

    // Keeps the path, opens the file for writing at its end, and writes the header and the operating system.
    // A path whose folder has no short form opens nothing and reports nothing; from then on only plain notes
    // are written. A file that cannot be opened is reported. Success, or why no file is in use.
    Status setLogFile(std::string_view path);

    // Opens or closes the run in the log. Results as writeLine(), also those of a missing title text.
    Status writeHeader(bool isEnd);

    // kNoInstallerSession: there is neither a file nor a session. In file mode, the characters written where
    // they are fewer than the line has, kFailed where none were.
    Status writeLine(std::string_view text);

    // An error report with the time in front.
    void writeFunction(std::string_view text);

    Status update(UREBaseInfo& info) override;

    // The path as the caller gave it; empty before setLogFile().
    std::string_view logFilePath() const { return logFilePath_.view(); }

    // The file of that folder's short form with kLogFileName, copied into `buffer` of kPathSize bytes, or with
    // null into one of the process's; returns that buffer.
    const char* componentLogPath(char* buffer) const;

private:
    explicit URELogObserver(URE& ure) : ure_(ure), file_(ure.ports.files) {}
    ~URELogObserver() override;

    Status openLog(std::string_view path);
    Status shortFolder(std::string_view folder, Buffer& shortened);
    void describeSystem();
    void lookForClusterLog(std::string_view folder);
    Status writeKeptLine();
    Status writeToSession(std::string_view text);
    Status writeInfo(const UREInfo& info);
    std::string_view prefixOf(const UREInfo& info, Buffer& time);

    URE& ure_;
    bool shortPathFailed_ = false;
    bool stampsTime_ = false;
    FixedText<kPathSize> componentLogPath_;
    FixedText<kPathSize> logFilePath_;
    FixedText<kPathSize> systemName_;
    FixedText<kPathSize> systemVersion_;
    OwnedFile file_;    // while it is open, lines go there
    std::string line_;  // room that is kept from line to line
};

}  // namespace kz7
