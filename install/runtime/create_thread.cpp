#include "install/runtime/create_thread.h"

#include <new>

#include "install/runtime/guarded.h"

namespace kz7 {

Status ureCreateThread(IThreads& threads, IReportSink& sink, void (*function)(void*), void* argument,
                       ThreadRecord* record) {
    const auto failed = [&sink](Status result, std::uint32_t probe, Status cause) {
        sink.trace(kTraceError, "ureCreateThread", probe, cause, {});
        return result;
    };
    if (function == nullptr || record == nullptr) {
        return failed(kNullArgument, 10, kNullArgument);
    }
    std::unique_ptr<ThreadStart> start(new (std::nothrow) ThreadStart{function, argument});
    if (start == nullptr) {
        return failed(kNoMemory, 20, kOutOfMemory);
    }
    const Status status =
        guarded([&] { return threads.startThread(start, record->stackSize, record->id, record->handle); });
    if (status != kSuccess) {
        return failed(status == kNoMemory ? kNoMemory : kThreadStartFailed, 30, status);
    }
    return kSuccess;
}

}  // namespace kz7
