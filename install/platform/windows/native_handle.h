// Windows handles: their owners, those of the ports, and the status of a call.
#pragma once

#include <windows.h>

#include <cstdint>
#include <memory>
#include <string>

#include "install/platform/status.h"

namespace kz7 {

template <BOOL(WINAPI* close)(HANDLE)>
struct CloseBy {
    using pointer = HANDLE;
    void operator()(HANDLE handle) const { close(handle); }
};
using NativeHandle = std::unique_ptr<void, CloseBy<CloseHandle>>;
using FileSearch = std::unique_ptr<void, CloseBy<FindClose>>;

// Owns the result of a call that returns INVALID_HANDLE_VALUE on failure; null then.
template <typename Owner>
Owner owned(HANDLE handle) {
    return Owner(handle == INVALID_HANDLE_VALUE ? nullptr : handle);
}

struct FreeModule {
    using pointer = HMODULE;
    void operator()(HMODULE library) const { FreeLibrary(library); }
};
using NativeLibrary = std::unique_ptr<void, FreeModule>;

struct FreeLocal {
    void operator()(void* memory) const { LocalFree(memory); }
};
using LocalMemory = std::unique_ptr<void, FreeLocal>;

// The handle of the system in a port's handle, and back.
template <typename Handle>
HANDLE native(Handle handle) {
    return reinterpret_cast<HANDLE>(static_cast<std::uintptr_t>(handle));
}
template <typename Handle>
Handle portHandle(HANDLE handle) {
    return Handle{reinterpret_cast<std::uintptr_t>(handle)};
}

// The status of a call that returns FALSE on failure.
inline Status statusOfCall(BOOL result) {
    return result != FALSE ? kSuccess : GetLastError();
}

// Reads an open file to its end.
inline Status readAll(HANDLE file, std::string& bytes) {
    std::string room(std::size_t{1} << 16, '\0');
    for (DWORD count = 1; count != 0; bytes.append(room, 0, count)) {
        if (ReadFile(file, room.data(), static_cast<DWORD>(room.size()), &count, nullptr) == FALSE) {
            return GetLastError();
        }
    }
    return kSuccess;
}

}  // namespace kz7
