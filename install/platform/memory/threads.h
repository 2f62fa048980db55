// The thread port without threads: a thread's function runs when it is waited for, or closed, in the thread
// that does so. Whatever is written with it runs the same way every time.
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
    std::map<ThreadHandle, std::unique_ptr<ThreadStart>> threads_;  // null: has run
    std::uint32_t lastId_ = 0;
};

}  // namespace kz7
