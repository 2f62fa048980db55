// The interfaces of progress and logging: observers of the installer runtime, and the output and input of a stream. The
// order of the operations is part of the interfaces.
#pragma once

#include <cstdint>
#include <memory>
#include <string_view>

#include "install/platform/status.h"
#include "install/runtime/infos.h"

namespace kz7 {

class IObserver {
public:
    virtual ~IObserver() = default;

    // Takes one info, on the thread that raises it. The runtime ignores the result.
    virtual Status update(UREBaseInfo& info) = 0;
};

inline constexpr std::string_view kCustomActionName = "KZ7CustomAction";

// Receives progress from custom actions, which identify themselves as kCustomActionName.
class IProgressObserver {
public:
    virtual ~IProgressObserver() = default;
    virtual void progress(std::string_view source, const UREProgressInfo& info) = 0;
};

class IObservable {
public:
    virtual ~IObservable() = default;
};

// The output of a stream's lines and the input of answers. Results are 0 or kFailed.
class UREExternalOutput {
public:
    // Writes at once. The text is a format without arguments: "%%" is a percent sign; any other use of '%' is written
    // unchanged. Null is ignored.
    virtual void writeMessage(const char* text) = 0;

    // Reads one line, truncated to `size` - 1 characters, without its line end. kFailed: end of input.
    virtual Status readResponse(char* buffer, std::uint32_t size) = 0;

    // Keeps a copy of at most 1,024 characters for flushQueue(); null and empty texts are ignored. kFailed: no
    // memory, the text is lost.
    virtual Status addQueueMessage(const char* text) = 0;

    // Writes the queued texts in order.
    virtual Status flushQueue() = 0;
    virtual std::int32_t getQueueCount() const = 0;

    virtual ~UREExternalOutput() = default;
};

// Handlers return kFailed for infos that they do not handle: the queue is then not flushed, and its texts go out with
// the next flush.
class UREExternalObserver : public IObserver {
public:
    virtual Status handleProgress(UREProgressInfo& info) = 0;
    virtual Status handleMessage(UREInfo& info) = 0;
};

// Calls the handler of an info, flushes the lines and reads the answer to a question.
class UREExternalObserverStream : public UREExternalObserver {
public:
    explicit UREExternalObserverStream(std::unique_ptr<UREExternalOutput> output);
    ~UREExternalObserverStream() override;

    Status update(UREBaseInfo& info) override;
    Status handleProgress(UREProgressInfo& info) override = 0;
    Status handleMessage(UREInfo& info) override = 0;

    // Reads the answer to a question whose lines were written. Without an answer nothing is set.
    virtual void handleQuery(UREInfo& info) = 0;

protected:
    UREExternalOutput& output() { return *output_; }

private:
    std::unique_ptr<UREExternalOutput> output_;
};

}  // namespace kz7
