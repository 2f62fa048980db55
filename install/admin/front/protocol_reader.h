// Reads the progress protocol of an installer program, line by line, and takes anything for a line: what is
// no line of the protocol is a text of the program's.
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

// A line without its line feed. The last field of a line is all that is left of it; only a query, which ends
// with the proposed answer, is split at its last separator.
ProtocolEvent readProtocolLine(std::string_view line);

// Cuts what comes in pieces into lines. A line of more than kMaxLine bytes loses its end.
class LineCutter {
public:
    static constexpr std::size_t kMaxLine = std::size_t{64} * 1024;

    using Taker = std::function<void(std::string_view line)>;
    void add(std::string_view piece, const Taker& take);

    // Gives a last line that has no line feed.
    void end(const Taker& take);

private:
    std::string line_;
};

}  // namespace kz7
