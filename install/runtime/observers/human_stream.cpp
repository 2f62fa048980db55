#include "install/runtime/observers/human_stream.h"

#include <algorithm>
#include <array>
#include <new>

#include "install/platform/text.h"
#include "install/runtime/observers/external_output_pipe.h"
#include "install/runtime/observers/text_columns.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kTaskListNumber = 4;
constexpr std::string_view kAbort = "ABORT";

UREExternalObserverHumanStream* theStream = nullptr;

// True for most texts: nothing in them needs to be escaped.
bool isPlain(std::string_view text) {
    return std::all_of(text.begin(), text.end(), [](char c) { return (c >= ' ' && c <= '~') || c == '\n'; });
}

// Escapes control characters but keeps line ends.
std::string shownLines(std::string_view text) {
    std::string shown;
    for (;;) {
        const std::size_t end = std::min(text.find('\n'), text.size());
        const std::string_view line = text.substr(0, end);
        shown += shownText(line.substr(0, line.size() - (line.ends_with('\r') ? 1 : 0)));
        if (end == text.size()) {
            return shown;
        }
        shown += '\n';
        text.remove_prefix(end + 1);
    }
}

}  // namespace

UREExternalObserverHumanStream* UREExternalObserverHumanStream::getInstance(URE& ure) {
    if (theStream == nullptr) {
        std::unique_ptr<UREExternalOutput> output(
            new (std::nothrow) UREExternalOutputPipe(ure.ports.console, ure.ports.terminal, ure));
        if (output != nullptr) {
            theStream = new (std::nothrow) UREExternalObserverHumanStream(ure, std::move(output));
        }
    }
    return theStream;
}

void UREExternalObserverHumanStream::release() {
    delete theStream;
}

UREExternalObserverHumanStream::UREExternalObserverHumanStream(URE& ure, std::unique_ptr<UREExternalOutput> output)
    : UREExternalObserverStream(std::move(output)), ure_(ure) {}

UREExternalObserverHumanStream::~UREExternalObserverHumanStream() {
    theStream = nullptr;
}

std::vector<std::string> UREExternalObserverHumanStream::linesOf(std::uint32_t textNumber, std::string_view text,
                                                                 std::string_view second, TerminalStream stream) {
    const std::array<Insert, 2> inserts = {text, second};
    char room[std::size_t{kBytesOfCharacter} * 2 * kMessageSize];
    std::size_t length = 0;
    ure_.messages.copyText(textNumber, inserts, room, sizeof room, length);
    std::string_view rest = cutText({room, std::min(length, sizeof room)}, 2 * kMessageSize);
    std::string shown;
    if (!isPlain(rest)) {
        shown = shownLines(rest);
        rest = shown;
    }
    const std::uint32_t columns = ure_.ports.terminal.look(stream).columns;
    std::vector<std::string> lines;
    while (!rest.empty()) {
        lines.emplace_back(cutText(takeWrappedLine(rest, columns), kMessageSize - 2));
    }
    return lines;
}

Status UREExternalObserverHumanStream::queueText(std::uint32_t textNumber, std::string_view text,
                                                 std::string_view second, bool endsLine) {
    Status status = kSuccess;
    std::vector<std::string> lines = linesOf(textNumber, text, second, TerminalStream::output);
    for (std::size_t i = 0; i < lines.size(); ++i) {
        lines[i].append(endsLine || i + 1 < lines.size() ? "\n" : "");
        if (output().addQueueMessage(lines[i].c_str()) != kSuccess) {
            status = kFailed;
        }
    }
    return status;
}

// Errors do not go where the results of a program are read.
Status UREExternalObserverHumanStream::writeError(std::string_view text) {
    std::string lines;
    for (const std::string& line : linesOf(kErrorMessage, text, {}, TerminalStream::error)) {
        lines.append(line).append("\n");
    }
    output().flushQueue();
    return ure_.ports.console.writeError(lines) == kSuccess ? kSuccess : kFailed;
}

Status UREExternalObserverHumanStream::handleProgress(UREProgressInfo& info) {
    FixedText<kMessageSize> description;
    info.copyDescription(description);
    const bool undo = info.task() == kUndoTask;
    switch (info.kind()) {
        case ProgressKind::start:
            return queueText(undo ? kUndoStartMessage : kTaskStartMessage, description.view(), {}, true);
        case ProgressKind::end:
            return queueText(undo ? kUndoEndMessage : kTaskEndMessage, description.view(), {}, true);
    }
    return kFailed;
}

Status UREExternalObserverHumanStream::handleMessage(UREInfo& info) {
    const std::uint32_t kind = info.messageClass();
    if (kind == kClassInformation && info.number() == kTaskListNumber) {
        return kFailed;
    }
    FixedText<kMessageSize> text;
    info.copyText(text);
    if (info.isQuestion()) {
        return queueText(kQuestionMessage, text.view(), info.defaultValue(), false);
    }
    if (kind == kClassError || kind == kClassOtherError) {
        return writeError(text.view());
    }
    return kind == kClassInformation ? queueText(kTextMessage, text.view(), {}, true) : kFailed;
}

void UREExternalObserverHumanStream::handleQuery(UREInfo& info) {
    char line[kBytesOfCharacter * kMessageSize];
    if (output().readResponse(line, sizeof line) != kSuccess) {
        return;
    }
    if (line == kAbort) {
        info.setResponse(nullptr);
    } else if (line[0] == '\0') {
        info.setResponse(FixedText<kMessageSize>(info.defaultValue()).c_str());
    } else {
        info.setResponse(line);
    }
}

}  // namespace kz7
