#include "install/platform/windows/trusted_folder.h"

#include <aclapi.h>
#include <sddl.h>

#include <cwchar>
#include <string_view>

namespace kz7 {
namespace {

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

// Security for what is created.
class ForAdministrators {
public:
    ForAdministrators() {
        PSECURITY_DESCRIPTOR made = nullptr;
        ConvertStringSecurityDescriptorToSecurityDescriptorW(kForAdministrators, SDDL_REVISION_1, &made, nullptr);
        descriptor_.reset(made);
        attributes_ = {sizeof attributes_, made, FALSE};
    }

    // Null: there is no memory for it.
    SECURITY_ATTRIBUTES* attributes() { return descriptor_ == nullptr ? nullptr : &attributes_; }

private:
    LocalMemory descriptor_;
    SECURITY_ATTRIBUTES attributes_{};
};

}  // namespace

// Not from the environment, which is the user's, and
// not from the shell, whose libraries would make every start slower.
std::wstring ownProgramData() {
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

NativeHandle openTrustedFolder(const std::wstring& folder, bool create) {
    ForAdministrators security;
    if (folder.empty() || security.attributes() == nullptr ||
        (create && CreateDirectoryW(folder.c_str(), security.attributes()) == FALSE &&
         GetLastError() != ERROR_ALREADY_EXISTS)) {
        return nullptr;
    }
    NativeHandle opened = openFolder(folder);
    return opened && isTrusted(opened.get(), true) ? std::move(opened) : nullptr;
}

NativeHandle openTrustedFile(const std::wstring& path, DWORD access, DWORD share, DWORD disposition) {
    ForAdministrators security;
    if (security.attributes() == nullptr) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
    NativeHandle file = owned<NativeHandle>(CreateFileW(path.c_str(), access | READ_CONTROL | FILE_READ_ATTRIBUTES,
                                                        share, security.attributes(), disposition,
                                                        FILE_ATTRIBUTE_NORMAL | FILE_FLAG_OPEN_REPARSE_POINT, nullptr));
    if (file && !isTrusted(file.get(), false)) {
        file.reset();
        SetLastError(ERROR_ACCESS_DENIED);
    }
    return file;
}

}  // namespace kz7
