// The thread port on POSIX.
#pragma once

#include <pthread.h>

#include <map>

#include "install/platform/threads.h"

namespace kz7 {

// For a thread that takes no signals and has a stack of that many bytes (0: the usual size). An error number,
// 0 for attributes that the caller destroys.
int makeThreadAttributes(std::size_t stackBytes, pthread_attr_t& attributes);

class EmbeddedThreads final : public IThreads {
public:
    Status start(std::unique_ptr<ThreadStart>& record, std::uint32_t stackBytes, std::uint32_t& id,
                 ThreadHandle& thread) override;
    Status wait(ThreadHandle thread) override;
    Status close(ThreadHandle thread) override;

private:
    struct Thread {
        pthread_t id{};
        bool joined = false;
    };

    std::map<ThreadHandle, Thread> threads_;
    std::uint32_t lastId_ = 0;
};

}  // namespace kz7
