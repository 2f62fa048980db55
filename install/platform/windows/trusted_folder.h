// Folders and files that only administrators and the system may change. What another user placed there first is not
// used.
#pragma once

#include <string>

#include "install/platform/windows/native_handle.h"

namespace kz7 {

// %ProgramData%\KZ7; empty if the system does not know the folder.
std::wstring ownProgramData();

// Opens a folder so that nobody can rename or replace it, with `create` after creating it. Null: it does not exist, or
// its owner is neither an administrator nor the system, or it is a link.
NativeHandle openTrustedFolder(const std::wstring& folder, bool create);

// Opens a file in a trusted folder, or creates it for administrators and the system only. Null on failure, with
// GetLastError(): ERROR_ACCESS_DENIED also for a file that is not trusted.
NativeHandle openTrustedFile(const std::wstring& path, DWORD access, DWORD share, DWORD disposition);

}  // namespace kz7
