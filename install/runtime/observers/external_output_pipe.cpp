#include "install/runtime/observers/external_output_pipe.h"

#include <algorithm>
#include <new>
#include <utility>

namespace kz7 {
namespace {

constexpr std::size_t kFirstCapacity = 4;

}  // namespace

UREExternalOutputPipe::UREExternalOutputPipe(IConsole& console, ITerminal& lines, IReportSink& sink)
    : console_(console), lines_(lines), sink_(sink) {
    makeRoom(kFirstCapacity, "UREExternalOutputPipe::UREExternalOutputPipe");
}

// Deliberate: "%%" becomes one percent sign in every text, foreign texts included; the texts were always printed as
// formats, and front ends expect it. No text is a format of the C library.
void UREExternalOutputPipe::writeMessage(const char* text) {
    std::string_view rest = text == nullptr ? std::string_view{} : text;
    while (!rest.empty()) {
        const std::size_t doubled = rest.find("%%");
        const std::size_t end = doubled == std::string_view::npos ? rest.size() : doubled + 1;
        console_.writeOutput(rest.substr(0, end));
        rest.remove_prefix(std::min(end + 1, rest.size()));
    }
    console_.flush();
}

Status UREExternalOutputPipe::readResponse(char* buffer, std::uint32_t size) {
    if (size == 0) {
        return kFailed;
    }
    Buffer line(buffer, size - 1, std::min<std::uint32_t>(size - 1, kMessageSize - 1));
    const Status status = lines_.readLine(line);
    buffer[status == kSuccess ? line.size : 0] = '\0';
    return status == kSuccess ? kSuccess : kFailed;
}

bool UREExternalOutputPipe::makeRoom(std::size_t capacity, std::string_view function) {
    std::uint32_t probe = 10;
    Messages grown(capacity <= capacity_ ? nullptr : new (std::nothrow) Message[capacity]);
    if (grown != nullptr) {
        probe = 20;
        std::size_t made = capacity_;
        while (made < capacity &&
               (grown[made] = Message(new (std::nothrow) char[kBytesOfCharacter * kQueuedCharacters + 1])) != nullptr) {
            ++made;
        }
        if (made == capacity) {
            std::move(queue_.get(), queue_.get() + capacity_, grown.get());
            queue_ = std::move(grown);
            capacity_ = capacity;
            return true;
        }
    }
    sink_.error(kCodeError, function, probe, kNoMemory);
    return false;
}

Status UREExternalOutputPipe::addQueueMessage(const char* text) {
    const std::string_view message = text == nullptr ? std::string_view{} : text;
    if (message.empty()) {
        return kSuccess;
    }
    if (count_ == capacity_ && !makeRoom(2 * capacity_, "UREExternalOutputPipe::addQueueMessage")) {
        return kFailed;
    }
    char* room = queue_[count_].get();
    const std::string_view kept = cutText(message, kQueuedCharacters);
    room[kept.copy(room, kept.size())] = '\0';
    ++count_;
    return kSuccess;
}

Status UREExternalOutputPipe::flushQueue() {
    for (std::size_t i = 0; i < count_; ++i) {
        writeMessage(queue_[i].get());
    }
    count_ = 0;
    return kSuccess;
}

}  // namespace kz7
