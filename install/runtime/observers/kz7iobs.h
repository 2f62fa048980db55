// The interfaces of progress and logging: who observes the installer runtime, and where what a front end or a
// person is told goes out. The order of the operations is part of them.
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

    // Takes one info, on the thread that raises it. What it returns is for whoever calls it alone: the runtime
    // goes on in any case.
    virtual Status update(UREBaseInfo& info) = 0;
};

inline constexpr std::string_view kCustomActionName = "KZ7CustomAction";

// Takes progress from the side of the custom actions, which name themselves kCustomActionName.
class IProgressObserver {
public:
    virtual ~IProgressObserver() = default;
    virtual void progress(std::string_view source, const UREProgressInfo& info) = 0;
};

class IObservable {
public:
    virtual ~IObservable() = default;
};

// Where the lines of a stream go out and answers come in. Results are 0 or kFailed.
class UREExternalOutput {
public:
    // Writes at once. The text is a format without arguments: "%%" is a percent sign, anything else after a
    // '%' comes out as it stands. Null is ignored.
    virtual void writeMessage(const char* text) = 0;

    // One line of at most `size` - 1 characters, cut at its end and terminated. kFailed: nothing is left.
    virtual Status readResponse(char* buffer, std::uint32_t size) = 0;

    // Keeps a copy of at most 1,024 characters for flushQueue(); null and empty texts are ignored. kFailed: no
    // memory, the text is lost.
    virtual Status addQueueMessage(const char* text) = 0;

    // Writes what was kept, in order.
    virtual Status flushQueue() = 0;
    virtual std::int32_t getQueueCount() const = 0;

    virtual ~UREExternalOutput() = default;
};

// Handlers return kFailed for what they do not handle: nothing is flushed then, what is queued goes out later.
class UREExternalObserver : public IObserver {
public:
    virtual Status handleProgress(UREProgressInfo& info) = 0;
    virtual Status handleMessage(UREInfo& info) = 0;
};

// Hands an info to its handler, flushes its lines, and lets a question be answered.
class UREExternalObserverStream : public UREExternalObserver {
public:
    explicit UREExternalObserverStream(std::unique_ptr<UREExternalOutput> output);
    ~UREExternalObserverStream() override;

    Status update(UREBaseInfo& info) override;
    Status handleProgress(UREProgressInfo& info) override = 0;
    Status handleMessage(UREInfo& info) override = 0;

    // Waits for the answer to a question whose lines are out. Without one nothing is set.
    virtual void handleQuery(UREInfo& info) = 0;

protected:
    UREExternalOutput& output() { return *output_; }

private:
    std::unique_ptr<UREExternalOutput> output_;
};

}  // namespace kz7
