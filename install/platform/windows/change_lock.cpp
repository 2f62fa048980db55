#include "install/platform/windows/change_lock.h"

#include <utility>

#include "install/platform/windows/trusted_folder.h"

namespace kz7 {
namespace {

constexpr ULONGLONG kPatience = 5000;  // milliseconds
constexpr DWORD kPoll = 20;            // milliseconds

}  // namespace

bool ChangeLock::tryHold() {
    const std::wstring folder = ownProgramData();
    const NativeHandle opened = openTrustedFolder(folder, true);
    if (!opened) {
        isWanted_ = false;
        return true;
    }
    file_ = openTrustedFile(folder + L"\\lock", FILE_READ_ATTRIBUTES | FILE_WRITE_DATA, 0, OPEN_ALWAYS);
    if (!file_ && GetLastError() == ERROR_SHARING_VIOLATION) {
        return false;
    }
    isWanted_ = file_ != nullptr;
    return true;
}

Status ChangeLock::hold() {
    if (!isWanted_ || file_ || fault_ != kSuccess) {
        return fault_;
    }
    const ULONGLONG begin = GetTickCount64();
    while (!tryHold()) {
        if (GetTickCount64() - begin >= kPatience) {
            fault_ = kBusy;
            busy_();
            break;
        }
        Sleep(kPoll);
    }
    return fault_;
}

Status ChangeLock::release() {
    file_.reset();
    return std::exchange(fault_, kSuccess);
}

}  // namespace kz7
