#include "install/platform/windows/ports.h"

#include <process.h>
#include <windows.h>

#include "install/platform/windows/native_handle.h"

namespace kz7 {
namespace {

unsigned __stdcall enter(void* record) {
    ThreadStart::run(record);
    return 0;
}

// Threads of the C runtime, which then keeps its data of each.
class WindowsThreads final : public IThreads {
public:
    Status startThread(std::unique_ptr<ThreadStart>& record, std::uint32_t stackBytes, std::uint32_t& id,
                       ThreadHandle& thread) override {
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

    Status waitThread(ThreadHandle thread) override {
        return WaitForSingleObject(native(thread), INFINITE) == WAIT_OBJECT_0 ? kSuccess : GetLastError();
    }

    Status closeThread(ThreadHandle thread) override { return statusOfCall(CloseHandle(native(thread))); }
};

}  // namespace

std::unique_ptr<IThreads> windowsThreads() {
    return std::make_unique<WindowsThreads>();
}

}  // namespace kz7
