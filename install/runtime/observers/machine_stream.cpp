#include "install/runtime/observers/machine_stream.h"

#include <new>

#include "install/runtime/observers/external_output_pipe.h"
#include "install/runtime/observers/log_observer.h"
#include "install/runtime/observers/protocol_lines.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kMediumQuestion = 1;
constexpr std::uint32_t kTaskListNumber = 4;

UREExternalObserverMachineStream* theStream = nullptr;

}  // namespace

UREExternalObserverMachineStream* UREExternalObserverMachineStream::getInstance(URE& ure) {
    if (theStream == nullptr) {
        std::unique_ptr<UREExternalOutput> output(
            new (std::nothrow) UREExternalOutputPipe(ure.ports.console, ure.ports.terminal, ure));
        if (output != nullptr) {
            theStream = new (std::nothrow) UREExternalObserverMachineStream(ure, std::move(output));
        }
    }
    return theStream;
}

void UREExternalObserverMachineStream::release() {
    delete theStream;
}

UREExternalObserverMachineStream::UREExternalObserverMachineStream(URE& ure, std::unique_ptr<UREExternalOutput> output)
    : UREExternalObserverStream(std::move(output)), ure_(ure) {
    ure_.ports.terminal.keepLineFeeds(true);
    this->output().writeMessage(kInstallStartLine);
}

UREExternalObserverMachineStream::~UREExternalObserverMachineStream() {
    const URELogObserver* log = URELogObserver::getInstance(ure_);
    output().writeMessage(installEndLine(log != nullptr ? log->logFilePath() : std::string_view{}).c_str());
    ure_.ports.terminal.keepLineFeeds(false);
    theStream = nullptr;
}

Status UREExternalObserverMachineStream::handleProgress(UREProgressInfo& info) {
    ProtocolLine line;
    return progressLine(info, line) ? output().addQueueMessage(line.c_str()) : kFailed;
}

Status UREExternalObserverMachineStream::handleMessage(UREInfo& info) {
    const std::uint32_t kind = info.messageClass();
    if (kind == kClassInformation && info.number() == kTaskListNumber) {
        return queueTaskList(info.taskList());
    }
    FixedText<kMessageSize> text;
    if (info.isQuestion()) {
        info.copyText(text);
        const Status told = info.number() == kMediumQuestion ? output().addQueueMessage(kMediumNotFoundLine) : kSuccess;
        // Deliberate: every question is written as one for the path of the medium; front ends know no other.
        const Status asked = output().addQueueMessage(queryLine(text.view(), info.defaultValue()).c_str());
        return told == kSuccess ? asked : told;
    }
    if (kind == kClassError || kind == kClassOtherError) {
        info.copyText(text);
        return output().addQueueMessage(errorLine(text.view()).c_str());
    }
    return kFailed;
}

Status UREExternalObserverMachineStream::queueTaskList(std::string_view list) {
    const TaskListLines lines = taskListLines(list);
    Status status = kSuccess;
    for (const char* text : {lines.count.c_str(), lines.identifiers.c_str(), "\n", lines.times.c_str(), "\n"}) {
        if (output().addQueueMessage(text) != kSuccess) {
            status = kFailed;
        }
    }
    return status;
}

void UREExternalObserverMachineStream::handleQuery(UREInfo& info) {
    char line[kBytesOfCharacter * kMessageSize];
    if (output().readResponse(line, sizeof line) != kSuccess) {
        return;
    }
    switch (parseAnswer(line)) {
        case AnswerLine::abort:
            info.setResponse(nullptr);
            break;
        case AnswerLine::response:
            // Deliberate: the text of an answer is not passed on, only that the user answered; front ends may send
            // anything after the colon.
            info.setResponse("");
            break;
        case AnswerLine::ignored:
            break;
    }
}

}  // namespace kz7
