// Parses the progress protocol of an installer program line by line. A line that is not part of the protocol is text of
// the program.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace kz7 {

enum class EventKind {
    installStart,
    installEnd,  // text: the log file
    undoStart,
    undoEnd,
    taskStart,  // task, isInstallation, startValue, text
    taskEnd,    // task, isInstallation, text
    taskCount,  // task: the number of tasks
    taskIds,    // fields
    taskTimes,  // fields
    error,      // text
    query,      // text, proposal
    other,      // text: the line
    nothing,    // an empty line
};

// Texts are parts of the line.
struct ProtocolEvent {
    EventKind kind = EventKind::nothing;
    std::string_view text = {};
    std::string_view proposal = {};
    bool isInstallation = false;
    std::uint32_t startValue = 0;
    std::int32_t task = 0;
    std::vector<std::string_view> fields = {};
};

// Parses a line without its line feed. The last field extends to the end of the line; only a query, which ends with the
// proposed answer, is split at its last separator.
ProtocolEvent readProtocolLine(std::string_view line);

// Divides a stream of bytes into lines. A line of more than kMaxLine bytes is truncated.
class LineCutter {
public:
    static constexpr std::size_t kMaxLine = std::size_t{64} * 1024;

    using Taker = std::function<void(std::string_view line)>;
    void add(std::string_view piece, const Taker& take);

    // Passes on a last line without a line feed.
    void end(const Taker& take);

private:
    std::string line_;
};

}  // namespace kz7
