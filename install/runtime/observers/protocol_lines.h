// The lines that the machine stream writes to a front end, and the answers that it reads, as pure functions.
// docs/man/kz7-progress.7 has the grammar.
#pragma once

#include <string_view>

#include "install/runtime/infos.h"
#include "install/runtime/observers/external_output_pipe.h"

namespace kz7 {

// At most 1,023 characters with the line feed: a longer line loses text, never the line feed. A line end in a text is
// written as a blank.
using ProtocolLine = FixedText<kMessageSize>;

inline constexpr const char* kInstallStartLine = "MESSAGE INFO INSTALLSTART\n";
inline constexpr const char* kMediumNotFoundLine = "MESSAGE ERROR CDNOTFOUND :: Install CD not found\n";

// False for an event that has no line.
bool progressLine(const UREProgressInfo& info, ProtocolLine& line);

ProtocolLine queryLine(std::string_view text, std::string_view defaultValue);
ProtocolLine errorLine(std::string_view text);
ProtocolLine installEndLine(std::string_view logFile);

// The lines of a task list. The second and third have no line feed: it is written separately.
struct TaskListLines {
    ProtocolLine count;
    FixedText<kQueuedCharacters + 1> identifiers;
    FixedText<kQueuedCharacters + 1> times;
};
TaskListLines taskListLines(std::string_view list);

enum class AnswerLine { ignored, abort, response };
AnswerLine parseAnswer(std::string_view line);

}  // namespace kz7
