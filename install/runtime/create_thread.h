// Starts the runtime's threads.
#pragma once

#include <cstdint>

#include "install/platform/threads.h"
#include "install/runtime/report_sink.h"

namespace kz7 {

// A thread to start. The caller closes the handle.
struct ThreadRecord {
    std::uint32_t id = 0;
    std::uint32_t stackSize = 0;  // bytes; 0: the host's default
    ThreadHandle handle = ThreadHandle::none;
};

// Starts a thread that calls `function` with `argument`. kNullArgument: no function or no record;
// kNoMemory; kThreadStartFailed: the system refused. Each failure is traced with the system's error, if any.
Status ureCreateThread(IThreads& threads, IReportSink& sink, void (*function)(void*), void* argument,
                       ThreadRecord* record);

}  // namespace kz7
