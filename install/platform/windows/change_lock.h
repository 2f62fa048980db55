// Keeps programs apart that change this machine's registry and services. A program holds the lock from its first
// access to a commit point, where others get their turn: a program that it starts, too.
#pragma once

#include <functional>
#include <string>

#include "install/platform/status.h"
#include "install/platform/windows/native_handle.h"

namespace kz7 {

// The lock is the file %ProgramData%\KZ7\lock, open without sharing, in a folder for administrators and the system
// only. Without a folder that can be trusted, changes are made without a lock: a folder that an unprivileged user made
// first must not keep administrators from their work. One thread.
class ChangeLock {
public:
    // `isWanted` is false for programs that only read. `busy` is called once for each kBusy that is not a repetition.
    ChangeLock(bool isWanted, std::function<void()> busy) : isWanted_(isWanted), busy_(std::move(busy)) {}

    // Takes the lock unless it is held. kBusy: another program kept it for 5 seconds; the result then stays so up to
    // the next release().
    Status hold();

    // Lets others take it. The result is that of hold() since the last release.
    Status release();

private:
    // False: another program has it. Otherwise it is held, or not wanted any more because there is none to be had.
    bool tryHold();

    bool isWanted_;
    std::function<void()> busy_;
    NativeHandle file_;
    Status fault_ = kSuccess;
};

}  // namespace kz7
