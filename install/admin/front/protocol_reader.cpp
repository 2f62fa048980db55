#include "install/admin/front/protocol_reader.h"

#include <algorithm>
#include <charconv>

namespace kz7 {
namespace {

constexpr std::string_view kSeparator = " :: ";

// Takes a word of the protocol and the separator after it off a line.
bool takeWord(std::string_view& rest, std::string_view word) {
    if (!rest.starts_with(word)) {
        return false;
    }
    const std::string_view after = rest.substr(word.size());
    if (!after.empty() && !after.starts_with(kSeparator)) {
        return false;
    }
    rest = after.substr(std::min(kSeparator.size(), after.size()));
    return true;
}

std::string_view takeField(std::string_view& rest) {
    const std::size_t end = std::min(rest.find(kSeparator), rest.size());
    const std::string_view field = rest.substr(0, end);
    rest.remove_prefix(std::min(end + kSeparator.size(), rest.size()));
    return field;
}

template <typename Number>
bool takeNumber(std::string_view& rest, Number& number) {
    const std::string_view field = takeField(rest);
    const auto end = std::from_chars(field.data(), field.data() + field.size(), number);
    return !field.empty() && end.ec == std::errc{} && end.ptr == field.data() + field.size();
}

bool readTask(std::string_view rest, bool starts, ProtocolEvent& event) {
    event.isInstallation = takeWord(rest, "INSTALLATION");
    if (!event.isInstallation && !takeWord(rest, "CONFIGURATION")) {
        return false;
    }
    if ((starts && !takeNumber(rest, event.startValue)) || !takeNumber(rest, event.task)) {
        return false;
    }
    event.kind = starts ? EventKind::taskStart : EventKind::taskEnd;
    event.text = rest;
    return true;
}

void readFields(std::string_view rest, ProtocolEvent& event) {
    while (!rest.empty()) {
        event.fields.push_back(takeField(rest));
    }
}

bool readQuery(std::string_view rest, ProtocolEvent& event) {
    event.kind = EventKind::query;
    std::size_t end = rest.rfind(kSeparator);
    if (end == std::string_view::npos && rest.ends_with(" ::")) {
        end = rest.size() - 3;  // blanks at the end of a line may have got lost
    }
    event.text = rest.substr(0, end);
    event.proposal = end == std::string_view::npos ? std::string_view{}
                                                   : rest.substr(std::min(end + kSeparator.size(), rest.size()));
    return true;
}

// False for what is no line of the protocol.
bool readKnown(std::string_view rest, ProtocolEvent& event) {
    const auto is = [&](std::string_view word, EventKind kind) {
        event.kind = kind;
        return takeWord(rest, word);
    };
    if (is("MESSAGE INFO INSTALLSTART", EventKind::installStart) ||
        is("MESSAGE INFO UNDOSTART", EventKind::undoStart) || is("MESSAGE INFO UNDOEND", EventKind::undoEnd)) {
        return true;
    }
    if (is("MESSAGE INFO INSTALLEND", EventKind::installEnd)) {
        event.text = rest;
        return true;
    }
    if (is("PROGRESS TASK START", EventKind::taskStart) || is("PROGRESS TASK END", EventKind::taskEnd)) {
        return readTask(rest, event.kind == EventKind::taskStart, event);
    }
    if (is("PROGRESS INFO TASKCOUNT", EventKind::taskCount)) {
        return takeNumber(rest, event.task);
    }
    if (is("PROGRESS INFO TASKIDS", EventKind::taskIds) || is("PROGRESS INFO TASKTIMES", EventKind::taskTimes)) {
        readFields(rest, event);
        return true;
    }
    if (rest.starts_with("MESSAGE ERROR ")) {
        // Whatever kind of error it is.
        event.kind = EventKind::error;
        takeField(rest);
        event.text = rest;
        return true;
    }
    return is("MESSAGE QUERY CDPATH", EventKind::query) && readQuery(rest, event);
}

}  // namespace

ProtocolEvent readProtocolLine(std::string_view line) {
    line.remove_suffix(line.ends_with('\r') ? 1 : 0);
    ProtocolEvent event;
    if (line.empty()) {
        return event;
    }
    if (!readKnown(line, event)) {
        event = {.kind = EventKind::other, .text = line};
    }
    return event;
}

void LineCutter::add(std::string_view piece, const Taker& take) {
    while (!piece.empty()) {
        const std::size_t end = piece.find('\n');
        const std::string_view part = piece.substr(0, end);
        line_.append(part.substr(0, kMaxLine - line_.size()));
        if (end == std::string_view::npos) {
            return;
        }
        take(line_);
        line_.clear();
        piece.remove_prefix(end + 1);
    }
}

void LineCutter::end(const Taker& take) {
    if (!line_.empty()) {
        take(line_);
        line_.clear();
    }
}

}  // namespace kz7
