#include "install/runtime/observers/protocol_lines.h"

#include <algorithm>
#include <initializer_list>
#include <span>

namespace kz7 {
namespace {

constexpr std::size_t kMaxTaskList = 1024;  // characters of a task list that are read

using TaskField = FixedText<20>;

// clang-format off
constexpr std::string_view kUndoStart         = "MESSAGE INFO UNDOSTART";
constexpr std::string_view kUndoEnd           = "MESSAGE INFO UNDOEND";
constexpr std::string_view kStartInstall      = "PROGRESS TASK START :: INSTALLATION :: %u :: %d :: %s";
constexpr std::string_view kStartConfigure    = "PROGRESS TASK START :: CONFIGURATION :: %u :: %d :: %s";
constexpr std::string_view kEndInstall        = "PROGRESS TASK END :: INSTALLATION :: %d :: %s";
constexpr std::string_view kEndConfigure      = "PROGRESS TASK END :: CONFIGURATION :: %d :: %s";
constexpr std::string_view kTaskCount         = "PROGRESS INFO TASKCOUNT :: %d";
constexpr std::string_view kTaskIdentifiers   = "PROGRESS INFO TASKIDS";
constexpr std::string_view kTaskTimes         = "PROGRESS INFO TASKTIMES";
constexpr std::string_view kQuery             = "MESSAGE QUERY CDPATH :: %s :: %s";
constexpr std::string_view kError             = "MESSAGE ERROR GENERAL :: %s";
constexpr std::string_view kInstallEnd        = "MESSAGE INFO INSTALLEND :: %s";
constexpr std::string_view kSeparator         = " :: ";

constexpr std::string_view kAbortAnswer       = "ABORT";
constexpr std::string_view kResponseAnswer    = "RESPONSE";
// clang-format on

// Deliberate: a line end inside a text becomes a blank; front ends read line by line.
void keepOnOneLine(char* text, std::size_t length) {
    std::replace_if(
        text, text + length, [](char c) { return c == '\n' || c == '\r'; }, ' ');
}

std::string_view upToNul(std::string_view text) {
    return text.substr(0, text.find('\0'));
}

ProtocolLine lineOf(std::string_view pattern, std::initializer_list<Insert> inserts) {
    char room[kBytesOfCharacter * kMessageSize];
    const std::size_t whole = composeInto(room, sizeof room, pattern, {inserts.begin(), inserts.size()});
    const std::size_t length = std::min(whole, sizeof room);
    keepOnOneLine(room, length);
    // The line feed and the terminator follow.
    ProtocolLine line(upToNul(cutText({room, length}, kMessageSize - 2)));
    line.append("\n");
    return line;
}

// Removes the next entry from a list; false if the list is empty.
bool takeTask(std::string_view& list, TaskField& identifier, TaskField& time) {
    if (list.empty()) {
        return false;
    }
    const std::size_t end = std::min(list.find(';'), list.size());
    const TaskField entry(list.substr(0, end));
    list.remove_prefix(std::min(end + 1, list.size()));
    const std::size_t comma = std::min(entry.view().find(','), entry.view().size());
    identifier.assign(entry.view().substr(0, comma));
    time.assign(entry.view().substr(comma).substr(comma == entry.view().size() ? 0 : 1));
    return true;
}

}  // namespace

bool progressLine(const UREProgressInfo& info, ProtocolLine& line) {
    if (info.kind() != ProgressKind::start && info.kind() != ProgressKind::end) {
        return false;
    }
    FixedText<kMessageSize> text;
    info.copyDescription(text);
    const std::string_view description = upToNul(text.view());
    const bool starts = info.kind() == ProgressKind::start;
    const auto task = static_cast<std::uint32_t>(info.task());
    if (info.task() == kUndoTask) {
        line = lineOf(starts ? kUndoStart : kUndoEnd, {});
    } else if (starts) {
        line = lineOf(info.isInstallation() ? kStartInstall : kStartConfigure,
                      {static_cast<std::uint32_t>(info.startValue()), task, description});
    } else {
        line = lineOf(info.isInstallation() ? kEndInstall : kEndConfigure, {task, description});
    }
    return true;
}

ProtocolLine queryLine(std::string_view text, std::string_view defaultValue) {
    return lineOf(kQuery, {upToNul(text), cutText(upToNul(defaultValue), kMessageSize - 1)});
}

ProtocolLine errorLine(std::string_view text) {
    return lineOf(kError, {text});
}

ProtocolLine installEndLine(std::string_view logFile) {
    return lineOf(kInstallEnd, {logFile});
}

TaskListLines taskListLines(std::string_view list) {
    char room[kBytesOfCharacter * kMaxTaskList];
    const std::size_t length = cutText(list, kMaxTaskList).copy(room, sizeof room);
    keepOnOneLine(room, length);
    std::string_view rest = upToNul({room, length});
    TaskListLines lines;
    lines.identifiers.assign(kTaskIdentifiers);
    lines.times.assign(kTaskTimes);
    TaskField identifier;
    TaskField time;
    std::uint32_t count = 0;
    for (; takeTask(rest, identifier, time); ++count) {
        lines.identifiers.append(kSeparator);
        lines.identifiers.append(identifier.view());
        lines.times.append(kSeparator);
        lines.times.append(time.view());
    }
    lines.count = lineOf(kTaskCount, {count});
    return lines;
}

AnswerLine parseAnswer(std::string_view line) {
    if (line.starts_with(kAbortAnswer)) {
        return AnswerLine::abort;
    }
    if (!line.starts_with(kResponseAnswer)) {
        return AnswerLine::ignored;
    }
    // Runs of colons separate the fields; the first begins with the keyword.
    const std::size_t colon = std::min(line.find(':'), line.size());
    const bool answered = line.find_first_not_of(':', colon) != std::string_view::npos;
    return answered ? AnswerLine::response : AnswerLine::ignored;
}

}  // namespace kz7
