#include "install/platform/windows/change_lock.h"

#include <aclapi.h>
#include <sddl.h>

#include <cwchar>
#include <string_view>
#include <utility>

namespace kz7 {
namespace {

constexpr ULONGLONG kPatience = 5000;  // milliseconds
constexpr DWORD kPoll = 20;            // milliseconds

// Owner and group: administrators. Full access for administrators and the system, inherited by the files inside; no
// access is inherited from the parent.
constexpr wchar_t kForAdministrators[] = L"O:BAG:BAD:P(A;OICI;FA;;;BA)(A;OICI;FA;;;SY)";

struct Owner {
    LocalMemory descriptor;
    PSID sid = nullptr;  // points into it; null: the owner cannot be read
};

Owner ownerOf(HANDLE file) {
    Owner owner;
    PSECURITY_DESCRIPTOR descriptor = nullptr;
    if (GetSecurityInfo(file, SE_FILE_OBJECT, OWNER_SECURITY_INFORMATION, &owner.sid, nullptr, nullptr, nullptr,
                        &descriptor) != ERROR_SUCCESS) {
        owner.sid = nullptr;
    }
    owner.descriptor.reset(descriptor);
    return owner;
}

NativeHandle openFolder(const std::wstring& folder) {
    // Without FILE_SHARE_DELETE: nobody can rename or replace the folder while it is checked and used.
    return owned<NativeHandle>(CreateFileW(folder.c_str(), FILE_READ_ATTRIBUTES | READ_CONTROL,
                                           FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_EXISTING,
                                           FILE_FLAG_BACKUP_SEMANTICS | FILE_FLAG_OPEN_REPARSE_POINT, nullptr));
}

// Administrators, the system, and the owner of the Windows folder, who can change everything anyway.
bool isTrustedOwner(PSID sid) {
    if (IsWellKnownSid(sid, WinBuiltinAdministratorsSid) != FALSE || IsWellKnownSid(sid, WinLocalSystemSid) != FALSE) {
        return true;
    }
    wchar_t system[MAX_PATH] = {};
    const UINT length = GetSystemWindowsDirectoryW(system, MAX_PATH);
    const NativeHandle folder = length != 0 && length < MAX_PATH ? openFolder(system) : nullptr;
    const Owner owner = folder ? ownerOf(folder.get()) : Owner{};
    return owner.sid != nullptr && EqualSid(owner.sid, sid) != FALSE;
}

bool isTrusted(HANDLE file, bool isFolder) {
    BY_HANDLE_FILE_INFORMATION information{};
    if (GetFileInformationByHandle(file, &information) == FALSE ||
        (information.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0 ||
        ((information.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) != isFolder) {
        return false;
    }
    const Owner owner = ownerOf(file);
    return owner.sid != nullptr && isTrustedOwner(owner.sid);
}

// %ProgramData%\KZ7; empty if the system does not know the folder. Not from the environment, which is the user's, and
// not from the shell, whose libraries would make every start slower.
std::wstring lockFolder() {
    constexpr std::wstring_view kSystemDrive = L"%SystemDrive%";
    wchar_t folder[MAX_PATH] = {};
    DWORD size = sizeof folder;
    wchar_t system[MAX_PATH] = {};
    if (RegGetValueW(HKEY_LOCAL_MACHINE, L"SOFTWARE\\Microsoft\\Windows NT\\CurrentVersion\\ProfileList",
                     L"ProgramData", RRF_RT_REG_SZ | RRF_RT_REG_EXPAND_SZ | RRF_NOEXPAND, nullptr, folder,
                     &size) != ERROR_SUCCESS ||
        GetSystemWindowsDirectoryW(system, MAX_PATH) == 0) {
        return {};
    }
    std::wstring path = folder;
    if (_wcsnicmp(folder, kSystemDrive.data(), kSystemDrive.size()) == 0) {
        path.replace(0, kSystemDrive.size(), system, 2);
    }
    return path + L"\\KZ7";
}

}  // namespace

bool ChangeLock::tryHold() {
    const std::wstring folder = lockFolder();
    PSECURITY_DESCRIPTOR made = nullptr;
    ConvertStringSecurityDescriptorToSecurityDescriptorW(kForAdministrators, SDDL_REVISION_1, &made, nullptr);
    const LocalMemory descriptor(made);
    SECURITY_ATTRIBUTES attributes{sizeof attributes, made, FALSE};
    if (folder.empty() || made == nullptr ||
        (CreateDirectoryW(folder.c_str(), &attributes) == FALSE && GetLastError() != ERROR_ALREADY_EXISTS)) {
        isWanted_ = false;
        return true;
    }
    const NativeHandle opened = openFolder(folder);
    if (!opened || !isTrusted(opened.get(), true)) {
        isWanted_ = false;
        return true;
    }
    file_ = owned<NativeHandle>(
        CreateFileW((folder + L"\\lock").c_str(), FILE_READ_ATTRIBUTES | FILE_WRITE_DATA | READ_CONTROL, 0, &attributes,
                    OPEN_ALWAYS, FILE_ATTRIBUTE_NORMAL | FILE_FLAG_OPEN_REPARSE_POINT, nullptr));
    if (!file_ && GetLastError() == ERROR_SHARING_VIOLATION) {
        return false;
    }
    isWanted_ = file_ != nullptr && isTrusted(file_.get(), false);
    if (!isWanted_) {
        file_.reset();
    }
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
