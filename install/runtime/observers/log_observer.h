// The log of a run: every info as a line, in a file or, without a file, in the installer session's log.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "install/platform/file_system.h"
#include "install/runtime/observers/kz7iobs.h"
#include "install/runtime/ure.h"

namespace kz7 {

inline constexpr std::string_view kLogFileName = "kz7msi.log";
inline constexpr std::size_t kPathSize = 261;  // characters of a file path with its terminator
inline constexpr std::size_t kPathBytes = kBytesOfCharacter * kPathSize;

// One per process. Register it with Takes::everything, after setLogFile(). Lines go to the session until a
// file is open. The engine outlives it.
class URELogObserver final : public IObserver {
public:
    // Creates it on the first call. Null: no memory.
    static URELogObserver* getInstance(URE& ure);
    static void release();

    // Keeps the path, opens the file for writing at its end, and writes the header and the operating system.
    // A path whose folder has no short form opens nothing and reports nothing; from then on only plain notes
    // are written. A file that cannot be opened is reported. Success, or why no file is in use.
    Status setLogFile(std::string_view path);

    // Writes the header or the trailer of the run. Results as writeLine(); also the status of a missing title text.
    Status writeHeader(bool isEnd);

    // kNoInstallerSession: neither a file nor a session is available. In file mode, after a short write, the number of
    // characters written, or kFailed if it is 0.
    Status writeLine(std::string_view text);

    // Reports an error; its line begins with the time.
    void writeFunction(std::string_view text);

    Status update(UREBaseInfo& info) override;

    // The path as the caller gave it; empty before setLogFile().
    std::string_view logFilePath() const { return logFilePath_.view(); }

    // Copies the path of kLogFileName in the short form of the log's folder into `buffer` of kPathBytes, or with
    // null into a static buffer. Returns that buffer.
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
    OwnedFile file_;    // file mode while it is open
    std::string line_;  // keeps its capacity from line to line
};

}  // namespace kz7
