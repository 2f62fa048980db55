#include "install/platform/embedded/ports.h"

#include "install/platform/embedded/threads.h"

#include <pthread.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <csignal>

#include "install/platform/handle_table.h"

namespace kz7 {
namespace {

// The page size and the smallest stack are known only at run time.
std::size_t usableStack(std::size_t bytes) {
    const auto page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    const std::size_t wanted = std::max(bytes, static_cast<std::size_t>(PTHREAD_STACK_MIN));
    return (wanted + page - 1) / page * page;
}

// The thread port on POSIX.
class EmbeddedThreads final : public IThreads {
public:
    Status startThread(std::unique_ptr<ThreadStart>& record, std::uint32_t stackBytes, std::uint32_t& id,
                       ThreadHandle& thread) override {
        pthread_attr_t attributes;
        if (makeThreadAttributes(stackBytes, attributes) != 0) {
            return kOutOfMemory;
        }
        const ThreadHandle handle = threads_.give({});
        const auto enter = [](void* given) -> void* {
            ThreadStart::run(given);
            return nullptr;
        };
        const int error = pthread_create(&threads_.find(handle)->id, &attributes, enter, record.get());
        pthread_attr_destroy(&attributes);
        if (error != 0) {
            threads_.close(handle);
            return kTooManyThreads;
        }
        static_cast<void>(record.release());
        id = static_cast<std::uint32_t>(handle);
        thread = handle;
        return kSuccess;
    }

    Status waitThread(ThreadHandle thread) override {
        Thread* const found = threads_.find(thread);
        if (found == nullptr) {
            return kInvalidHandle;
        }
        if (!found->joined && pthread_join(found->id, nullptr) != 0) {
            return kInvalidHandle;
        }
        found->joined = true;
        return kSuccess;
    }

    Status closeThread(ThreadHandle thread) override {
        Thread* const found = threads_.find(thread);
        if (found == nullptr) {
            return kInvalidHandle;
        }
        if (!found->joined) {
            pthread_detach(found->id);
        }
        threads_.close(thread);
        return kSuccess;
    }

private:
    struct Thread {
        pthread_t id{};
        bool joined = false;
    };

    HandleTable<ThreadHandle, Thread> threads_;
};

}  // namespace

std::unique_ptr<IThreads> embeddedThreads() {
    return std::make_unique<EmbeddedThreads>();
}

int makeThreadAttributes(std::size_t stackBytes, pthread_attr_t& attributes) {
    int error = pthread_attr_init(&attributes);
    if (error != 0) {
        return error;
    }
    sigset_t signals;
    sigfillset(&signals);
    error = pthread_attr_setsigmask_np(&attributes, &signals);
    if (error == 0 && stackBytes != 0) {
        error = pthread_attr_setstacksize(&attributes, usableStack(stackBytes));
    }
    if (error != 0) {
        pthread_attr_destroy(&attributes);
    }
    return error;
}

}  // namespace kz7
