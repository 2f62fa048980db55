// The thread port without threads: the function of a thread runs when the thread is waited for or closed, in the
// calling thread. Tests that use it always run in the same order.
#pragma once

#include <map>

#include "install/platform/threads.h"

namespace kz7 {

class MemoryThreads final : public IThreads {
public:
    std::size_t openHandles() const { return threads_.size(); }

    Status startThread(std::unique_ptr<ThreadStart>& record, std::uint32_t stackBytes, std::uint32_t& id,
                       ThreadHandle& thread) override;
    Status waitThread(ThreadHandle thread) override;
    Status closeThread(ThreadHandle thread) override;

private:
    std::map<ThreadHandle, std::unique_ptr<ThreadStart>> threads_;  // null: it has run
    std::uint32_t lastId_ = 0;
};

}  // namespace kz7
