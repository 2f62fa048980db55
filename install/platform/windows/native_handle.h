// Owners of the system's own handles, for the files of this folder: nothing that throws leaks one.
#pragma once

#include <windows.h>

#include <memory>

namespace kz7 {

struct CloseNativeHandle {
    using pointer = HANDLE;
    void operator()(HANDLE handle) const { CloseHandle(handle); }
};
using NativeHandle = std::unique_ptr<void, CloseNativeHandle>;

// The result of a call that returns INVALID_HANDLE_VALUE on failure; null then.
inline NativeHandle ownedFile(HANDLE file) {
    return NativeHandle(file == INVALID_HANDLE_VALUE ? nullptr : file);
}

struct CloseSearch {
    using pointer = HANDLE;
    void operator()(HANDLE search) const { FindClose(search); }
};
using FileSearch = std::unique_ptr<void, CloseSearch>;

// The same for FindFirstFile.
inline FileSearch ownedSearch(HANDLE search) {
    return FileSearch(search == INVALID_HANDLE_VALUE ? nullptr : search);
}

struct FreeLocal {
    void operator()(void* memory) const { LocalFree(memory); }
};
using LocalMemory = std::unique_ptr<void, FreeLocal>;

}  // namespace kz7
