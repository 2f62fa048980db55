// RAII owners of Windows handles.
#pragma once

#include <windows.h>

#include <memory>

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

}  // namespace kz7
