#include "install/runtime/observers/kz7iobs.h"

#include <utility>

#include "install/runtime/guarded.h"

namespace kz7 {

UREExternalObserverStream::UREExternalObserverStream(std::unique_ptr<UREExternalOutput> output)
    : output_(std::move(output)) {}

UREExternalObserverStream::~UREExternalObserverStream() = default;

Status UREExternalObserverStream::update(UREBaseInfo& info) {
    if (info.getInfoType() == InfoType::progress) {
        const Status handled = guarded([&] { return handleProgress(static_cast<UREProgressInfo&>(info)); });
        if (handled == kSuccess) {
            output_->flushQueue();
        }
        return handled;
    }
    auto& message = static_cast<UREInfo&>(info);
    const Status handled = guarded([&] { return handleMessage(message); });
    if (handled == kSuccess) {
        output_->flushQueue();
        if (message.isQuestion()) {
            handleQuery(message);
            output_->writeMessage("\n");
        }
    }
    return handled;
}

}  // namespace kz7
