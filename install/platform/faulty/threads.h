// Threads whose chosen call fails. The counter is for one thread: use it over the threads in memory.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/threads.h"

namespace kz7 {

class FaultyThreads final : public IThreads {
public:
    FaultyThreads(IThreads& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status start(std::unique_ptr<ThreadStart>& record, std::uint32_t stackBytes, std::uint32_t& id,
                 ThreadHandle& thread) override {
        return unlessFailing(faults_, "startThread", [&] { return real_.start(record, stackBytes, id, thread); });
    }
    Status wait(ThreadHandle thread) override {
        return unlessFailing(faults_, "waitThread", [&] { return real_.wait(thread); });
    }
    Status close(ThreadHandle thread) override {
        return closingAnyway(faults_, "closeThread", [&] { return real_.close(thread); });
    }

private:
    IThreads& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
