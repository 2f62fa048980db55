// The thread port: threads that run one function to its end.
#pragma once

#include <cstdint>
#include <memory>

#include "install/platform/status.h"

namespace kz7 {

enum class ThreadHandle : std::uint64_t { none = 0 };

// The function of a new thread and its argument.
struct ThreadStart {
    void (*function)(void*) = nullptr;
    void* argument = nullptr;

    // For the platform's own entry point: frees the record and calls the function.
    static void run(void* record) {
        const ThreadStart start = *std::unique_ptr<ThreadStart>(static_cast<ThreadStart*>(record));
        start.function(start.argument);
    }
};

// kInvalidHandle: the null handle or one that is not open. One thread.
class IThreads {
public:
    virtual ~IThreads() = default;

    // Starts a thread with a stack of `stackBytes` (0: the host's default) and all signals blocked. On success the
    // new thread owns the record, on failure the caller does. `id` is unique in this process. The caller closes
    // `thread`.
    virtual Status startThread(std::unique_ptr<ThreadStart>& record, std::uint32_t stackBytes, std::uint32_t& id,
                               ThreadHandle& thread) = 0;

    // Waits until the thread has ended. May be called again.
    virtual Status waitThread(ThreadHandle thread) = 0;

    // A thread that has not ended continues to run.
    virtual Status closeThread(ThreadHandle thread) = 0;
};

}  // namespace kz7
