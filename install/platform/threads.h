// The thread port: threads that run one function to its end.
#pragma once

#include <cstdint>
#include <memory>

#include "install/platform/status.h"

namespace kz7 {

enum class ThreadHandle : std::uint64_t { none = 0 };

// What a new thread calls.
struct ThreadStart {
    void (*function)(void*) = nullptr;
    void* argument = nullptr;

    // For the platform's own entry point: frees the record and calls the function.
    static void run(void* record) {
        const ThreadStart start = *std::unique_ptr<ThreadStart>(static_cast<ThreadStart*>(record));
        start.function(start.argument);
    }
};

// kInvalidHandle: a handle that is none or closed. One thread makes these calls.
class IThreads {
public:
    virtual ~IThreads() = default;

    // Starts a thread with a stack of `stackBytes` (0: the host's usual size), which takes no signals. The
    // record is the new thread's on success and stays the caller's on failure. `id` tells the threads of this
    // process apart. The caller closes `thread`.
    virtual Status startThread(std::unique_ptr<ThreadStart>& record, std::uint32_t stackBytes, std::uint32_t& id,
                               ThreadHandle& thread) = 0;

    // Waits until the thread has ended, any number of times; what it wrote is then seen.
    virtual Status waitThread(ThreadHandle thread) = 0;

    // A thread that still runs, runs on.
    virtual Status closeThread(ThreadHandle thread) = 0;
};

}  // namespace kz7
