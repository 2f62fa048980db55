#define _CRT_RAND_S
#include "install/platform/windows/file_system.h"

#include <io.h>
#include <windows.h>

#include <cerrno>
#include <cstdlib>
#include <string>

#include "install/platform/windows/paths.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

constexpr std::size_t kReadPiece = 64 * 1024;
constexpr std::size_t kWritePiece = 1 << 30;

HANDLE native(FileHandle file) {
    return reinterpret_cast<HANDLE>(static_cast<std::uintptr_t>(file));
}

bool namesNothing(std::string_view path) {
    return !isAbsolutePath(path) || path.find('\0') != std::string_view::npos;
}

// A name for a new file in a folder; empty when the system has no randomness.
std::string randomName(std::string_view folder) {
    static constexpr char kDigits[] = "0123456789abcdef";
    std::string name = std::string(folder) + ".kz7-";
    for (int word = 0; word < 4; ++word) {
        unsigned noise = 0;
        if (rand_s(&noise) != 0) {
            return {};
        }
        for (int shift = 28; shift >= 0; shift -= 4) {
            name += kDigits[noise >> shift & 15];
        }
    }
    return name;
}

Status checkTarget(const std::string& path, bool replace) {
    const DWORD found = GetFileAttributesW(WideText(path).c_str());
    if (found == INVALID_FILE_ATTRIBUTES) {
        return kSuccess;
    }
    constexpr DWORD kNotAFile = FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_DEVICE | FILE_ATTRIBUTE_REPARSE_POINT;
    return (found & kNotAFile) != 0 ? kBadPathname : replace ? kSuccess : kFileExists;
}

}  // namespace

Status WindowsFileSystem::probe(std::string_view path) {
    // Nothing is taken relative to the current folder.
    if (namesNothing(path)) {
        return kFileNotFound;
    }
    if (_waccess(WideText(path).c_str(), 0) == 0) {
        return kSuccess;
    }
    return errno == EACCES ? kAccessDenied : kFileNotFound;
}

Status WindowsFileSystem::readFile(std::string_view path, std::string& content) {
    if (namesNothing(path)) {
        return kFileNotFound;
    }
    const HANDLE file = CreateFileW(WideText(path).c_str(), GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr,
                                    OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
    if (file == INVALID_HANDLE_VALUE) {
        return GetLastError() == ERROR_PATH_NOT_FOUND ? kFileNotFound : GetLastError();
    }
    std::string read;
    DWORD count = 0;
    Status status = kSuccess;
    do {
        const std::size_t length = read.size();
        read.resize(length + kReadPiece);
        if (ReadFile(file, read.data() + length, kReadPiece, &count, nullptr) == FALSE) {
            status = GetLastError();
            count = 0;
        }
        read.resize(length + count);
    } while (count != 0);
    CloseHandle(file);
    if (status == kSuccess) {
        content = std::move(read);
    }
    return status;
}

Status WindowsFileSystem::openForAppend(std::string_view path, FileHandle& file) {
    if (namesNothing(path)) {
        return kFileNotFound;
    }
    const HANDLE opened =
        CreateFileW(WideText(path).c_str(), FILE_APPEND_DATA, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_ALWAYS,
                    FILE_ATTRIBUTE_NORMAL | FILE_FLAG_OPEN_REPARSE_POINT, nullptr);
    if (opened == INVALID_HANDLE_VALUE) {
        return GetLastError();
    }
    BY_HANDLE_FILE_INFORMATION information{};
    if (GetFileInformationByHandle(opened, &information) != FALSE &&
        (information.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0) {
        CloseHandle(opened);
        return kAccessDenied;
    }
    file = FileHandle{reinterpret_cast<std::uintptr_t>(opened)};
    return kSuccess;
}

Status WindowsFileSystem::write(FileHandle file, std::string_view data, std::uint32_t& written) {
    DWORD count = 0;
    const BOOL taken = WriteFile(native(file), data.data(), static_cast<DWORD>(data.size()), &count, nullptr);
    written = count;
    return taken != FALSE ? kSuccess : GetLastError();
}

Status WindowsFileSystem::closeFile(FileHandle file) {
    return CloseHandle(native(file)) != FALSE ? kSuccess : GetLastError();
}

Status WindowsFileSystem::writeFile(std::string_view path, std::string_view content, bool replace) {
    const std::string target(path);
    const std::string unfinished = randomName(path.substr(0, path.find_last_of("\\/") + 1));
    if (namesNothing(path) || target.ends_with('\\') || target.ends_with('/')) {
        return kBadPathname;
    }
    if (const Status status = checkTarget(target, replace); status != kSuccess || unfinished.empty()) {
        return status != kSuccess ? status : kGeneralFailure;
    }
    const HANDLE opened = CreateFileW(WideText(unfinished).c_str(), GENERIC_WRITE, 0, nullptr, CREATE_NEW,
                                      FILE_ATTRIBUTE_NORMAL, nullptr);
    if (opened == INVALID_HANDLE_VALUE) {
        return GetLastError();
    }
    OwnedFile file(*this);
    file.receive() = FileHandle{reinterpret_cast<std::uintptr_t>(opened)};
    Status status = kSuccess;
    while (status == kSuccess && !content.empty()) {
        std::uint32_t written = 0;
        status = write(file.get(), content.substr(0, kWritePiece), written);
        content.remove_prefix(written);
    }
    if (status == kSuccess && FlushFileBuffers(opened) == FALSE) {
        status = GetLastError();
    }
    file.reset();
    const DWORD how = MOVEFILE_WRITE_THROUGH | (replace ? DWORD{MOVEFILE_REPLACE_EXISTING} : 0);
    if (status == kSuccess && MoveFileExW(WideText(unfinished).c_str(), WideText(target).c_str(), how) == FALSE) {
        status = GetLastError() == ERROR_ALREADY_EXISTS ? kFileExists : GetLastError();
    }
    if (status != kSuccess) {
        DeleteFileW(WideText(unfinished).c_str());
    }
    return status;
}

Status WindowsFileSystem::findFile(std::string_view pattern, std::string& name) {
    if (namesNothing(pattern)) {
        return kFileNotFound;
    }
    const std::string_view names = pattern.substr(pattern.find_last_of("\\/:") + 1);
    WIN32_FIND_DATAW found{};
    const HANDLE search = FindFirstFileW(WideText(pattern).c_str(), &found);
    if (search == INVALID_HANDLE_VALUE) {
        return GetLastError() == ERROR_PATH_NOT_FOUND ? kFileNotFound : GetLastError();
    }
    // The system's '?' also stands for no character at all.
    std::string first;
    do {
        const std::string each = textFromWide(found.cFileName);
        if (fitsPattern(each, names) && (first.empty() || each < first)) {
            first = each;
        }
    } while (FindNextFileW(search, &found) != FALSE);
    FindClose(search);
    if (first.empty()) {
        return kFileNotFound;
    }
    name = std::move(first);
    return kSuccess;
}

Status WindowsFileSystem::productPath(std::string_view hostPath, std::string& path) {
    const WideText given(hostPath);
    std::string whole =
        textOf([&](wchar_t* room, DWORD size) { return GetFullPathNameW(given.c_str(), size, room, nullptr); });
    if (namesNothing(whole)) {
        return kInvalidName;
    }
    path = std::move(whole);
    return kSuccess;
}

}  // namespace kz7
