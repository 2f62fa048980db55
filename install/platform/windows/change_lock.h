// A lock between programs that change this machine's registry and services. A program holds it from its first access
// to the next commit point. It is free while a child program runs, which may need it.
#pragma once

#include <functional>
#include <string>

#include "install/platform/status.h"
#include "install/platform/windows/native_handle.h"

namespace kz7 {

// The lock is the file %ProgramData%\KZ7\lock, opened without sharing, in a folder for administrators and the system
// only. If the folder cannot be trusted, changes are made without the lock: a folder that an unprivileged user created
// first must not keep administrators from their work. One thread.
class ChangeLock {
public:
    // `isWanted` is false for programs that only read. `busy` is called when a wait for the lock ends without it.
    ChangeLock(bool isWanted, std::function<void()> busy) : isWanted_(isWanted), busy_(std::move(busy)) {}

    // Takes the lock unless it is held. kBusy: another program held it for 5 seconds. The result is then kBusy until
    // the next release().
    Status hold();

    // Lets other programs take it. Returns the result of hold() since the last release.
    Status release();

private:
    // False: another program has the lock. True: this program has it, or continues without it.
    bool tryHold();

    bool isWanted_;
    std::function<void()> busy_;
    NativeHandle file_;
    Status fault_ = kSuccess;
};

}  // namespace kz7
