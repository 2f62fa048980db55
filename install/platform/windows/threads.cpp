#include "install/platform/windows/threads.h"

#include <process.h>
#include <windows.h>

namespace kz7 {
namespace {

HANDLE native(ThreadHandle thread) {
    return reinterpret_cast<HANDLE>(static_cast<std::uintptr_t>(thread));
}

unsigned __stdcall enter(void* record) {
    ThreadStart::run(record);
    return 0;
}

}  // namespace

Status WindowsThreads::startThread(std::unique_ptr<ThreadStart>& record, std::uint32_t stackBytes, std::uint32_t& id,
                                   ThreadHandle& thread) {
    unsigned number = 0;
    const std::uintptr_t handle = _beginthreadex(nullptr, stackBytes, enter, record.get(), 0, &number);
    if (handle == 0) {
        return _doserrno != 0 ? static_cast<Status>(_doserrno) : kTooManyThreads;
    }
    static_cast<void>(record.release());
    id = number;
    thread = ThreadHandle{handle};
    return kSuccess;
}

Status WindowsThreads::waitThread(ThreadHandle thread) {
    return WaitForSingleObject(native(thread), INFINITE) == WAIT_OBJECT_0 ? kSuccess : GetLastError();
}

Status WindowsThreads::closeThread(ThreadHandle thread) {
    return CloseHandle(native(thread)) != FALSE ? kSuccess : GetLastError();
}

}  // namespace kz7
