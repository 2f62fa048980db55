// A stream on the process's standard output, with a queue, and standard input.
#pragma once

#include <memory>

#include "install/platform/console.h"
#include "install/platform/terminal.h"
#include "install/runtime/observers/kz7iobs.h"
#include "install/runtime/report_sink.h"

namespace kz7 {

inline constexpr std::size_t kQueuedCharacters = 1024;  // of a queued message

// The queue grows and never shrinks. Writing to a pipe without a reader succeeds and has no effect.
class UREExternalOutputPipe final : public UREExternalOutput {
public:
    // Without memory for the queue, which is reported, queued texts are lost.
    UREExternalOutputPipe(IConsole& console, ITerminal& lines, IReportSink& sink);

    void writeMessage(const char* text) override;
    Status readResponse(char* buffer, std::uint32_t size) override;
    Status addQueueMessage(const char* text) override;
    Status flushQueue() override;
    std::int32_t getQueueCount() const override { return static_cast<std::int32_t>(count_); }

private:
    using Message = std::unique_ptr<char[]>;
    using Messages = std::unique_ptr<Message[]>;

    bool makeRoom(std::size_t capacity, std::string_view function);

    IConsole& console_;
    ITerminal& lines_;
    IReportSink& sink_;
    Messages queue_;
    std::size_t count_ = 0;
    std::size_t capacity_ = 0;
};

}  // namespace kz7
