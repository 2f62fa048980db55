#include "install/platform/memory/threads.h"

namespace kz7 {

Status MemoryThreads::startThread(std::unique_ptr<ThreadStart>& record, std::uint32_t, std::uint32_t& id,
                                  ThreadHandle& thread) {
    id = ++lastId_;
    thread = ThreadHandle{lastId_};
    threads_.emplace(thread, std::move(record));
    return kSuccess;
}

Status MemoryThreads::waitThread(ThreadHandle thread) {
    const auto found = threads_.find(thread);
    if (found == threads_.end()) {
        return kInvalidHandle;
    }
    if (found->second != nullptr) {
        ThreadStart::run(found->second.release());
    }
    return kSuccess;
}

Status MemoryThreads::closeThread(ThreadHandle thread) {
    const Status status = waitThread(thread);
    threads_.erase(thread);
    return status;
}

}  // namespace kz7
