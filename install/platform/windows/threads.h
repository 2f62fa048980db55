// The thread port on Windows, through the C runtime, which then knows the threads.
#pragma once

#include "install/platform/threads.h"

namespace kz7 {

class WindowsThreads final : public IThreads {
public:
    Status startThread(std::unique_ptr<ThreadStart>& record, std::uint32_t stackBytes, std::uint32_t& id,
                       ThreadHandle& thread) override;
    Status waitThread(ThreadHandle thread) override;
    Status closeThread(ThreadHandle thread) override;
};

}  // namespace kz7
