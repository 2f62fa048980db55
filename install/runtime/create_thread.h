// The runtime's way to start a thread.
#pragma once

#include <cstdint>

#include "install/platform/threads.h"
#include "install/runtime/report_sink.h"

namespace kz7 {

// A thread to start and, once started, its handle, which the starter closes.
struct ThreadRecord {
    std::uint32_t id = 0;
    std::uint32_t stackSize = 0;  // bytes; 0: the host's usual size
    ThreadHandle handle = ThreadHandle::none;
};

// Starts a thread that calls `function` with `argument`. kNullArgument: no function or no record;
// kNoMemory; kThreadStartFailed: the system refused. Each is traced, with the system's error where
// there is one.
Status ureCreateThread(IThreads& threads, IReportSink& sink, void (*function)(void*), void* argument,
                       ThreadRecord* record);

}  // namespace kz7
