#define _CRT_RAND_S  // NOLINT(bugprone-reserved-identifier): what rand_s() asks for
#include "install/platform/windows/ports.h"

#include <io.h>
#include <windows.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <string>

#include "install/platform/text.h"
#include "install/platform/windows/native_handle.h"
#include "install/platform/windows/paths.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

constexpr DWORD kWithoutOurRights = SECURITY_SQOS_PRESENT | SECURITY_IDENTIFICATION;
constexpr std::size_t kWritePiece = 1 << 30;

bool namesNothing(std::string_view path) {
    return !isAbsolutePath(path) || path.find('\0') != std::string_view::npos;
}

std::string wholePath(std::string_view path) {
    const WideText given(path);
    return textOf([&](wchar_t* room, DWORD size) { return GetFullPathNameW(given.c_str(), size, room, nullptr); });
}

// Whether an open file or folder is where its path says, so that no folder of the path is a link.
bool liesAt(HANDLE file, std::string_view path) {
    const auto withoutSeparator = [](std::string_view text) { return text.substr(0, text.find_last_not_of('\\') + 1); };
    std::string place = textOf([&](wchar_t* room, DWORD size) {
        return GetFinalPathNameByHandleW(file, room, size, FILE_NAME_NORMALIZED | VOLUME_NAME_DOS);
    });
    if (place.starts_with(R"(\\?\UNC\)")) {
        place.replace(0, 8, R"(\\)");
    } else {
        place.erase(0, 4);  // the "\\?\" of "\\?\C:\..."
    }
    // The path may contain short names.
    const WideText given(path);
    const std::string asked =
        textOf([&](wchar_t* room, DWORD size) { return GetLongPathNameW(given.c_str(), room, size); });
    const WideText left(withoutSeparator(place));
    const WideText right(withoutSeparator(asked));
    return left.size() != 0 && CompareStringOrdinal(left.c_str(), -1, right.c_str(), -1, TRUE) == CSTR_EQUAL;
}

// A random name for a new file in a folder; empty if the system has no random numbers.
std::string randomName(std::string_view folder) {
    std::string name = std::string(folder) + ".kz7-";
    for (int word = 0; word < 4; ++word) {
        unsigned noise = 0;
        if (rand_s(&noise) != 0) {
            return {};
        }
        appendHex(noise, 8, name);
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

class WindowsFileSystem final : public IFileSystem {
public:
    Status probe(std::string_view path) override {
        // Nothing is relative to the current folder, where another user could place files.
        if (namesNothing(path)) {
            return kFileNotFound;
        }
        if (_waccess(WideText(path).c_str(), 0) == 0) {
            return kSuccess;
        }
        return errno == EACCES ? kAccessDenied : kFileNotFound;
    }

    Status readFile(std::string_view path, std::string& content) override {
        if (namesNothing(path)) {
            return kFileNotFound;
        }
        // Others may have chosen the path. If it is a named pipe, its server can identify this program but cannot
        // impersonate it.
        const NativeHandle file = owned<NativeHandle>(
            CreateFileW(WideText(path).c_str(), GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr,
                        OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL | kWithoutOurRights, nullptr));
        if (!file) {
            return GetLastError() == ERROR_PATH_NOT_FOUND ? kFileNotFound : GetLastError();
        }
        std::string read;
        const Status status = readAll(file.get(), read);
        if (status == kSuccess) {
            content = std::move(read);
        }
        return status;
    }

    Status openForAppend(std::string_view path, FileHandle& file) override {
        if (namesNothing(path)) {
            return kFileNotFound;
        }
        const std::string whole = wholePath(path);
        if (whole.starts_with(R"(\\.\)")) {
            return kAccessDenied;
        }
        // Opens the folder first and holds it, so that no file is created behind a link.
        const std::string folderPath = whole.substr(0, whole.find_last_of('\\') + 1);
        const NativeHandle folder = owned<NativeHandle>(
            CreateFileW(WideText(folderPath).c_str(), FILE_READ_ATTRIBUTES, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr,
                        OPEN_EXISTING, FILE_FLAG_BACKUP_SEMANTICS | kWithoutOurRights, nullptr));
        if (!folder) {
            return GetLastError() == ERROR_FILE_NOT_FOUND ? kPathNotFound : GetLastError();
        }
        if (!liesAt(folder.get(), folderPath)) {
            return kAccessDenied;
        }
        NativeHandle opened = owned<NativeHandle>(CreateFileW(
            WideText(whole).c_str(), FILE_APPEND_DATA, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr, OPEN_ALWAYS,
            FILE_ATTRIBUTE_NORMAL | FILE_FLAG_OPEN_REPARSE_POINT | kWithoutOurRights, nullptr));
        if (!opened) {
            return GetLastError();
        }
        BY_HANDLE_FILE_INFORMATION information{};
        if (GetFileType(opened.get()) != FILE_TYPE_DISK ||
            GetFileInformationByHandle(opened.get(), &information) == FALSE ||
            (information.dwFileAttributes & (FILE_ATTRIBUTE_REPARSE_POINT | FILE_ATTRIBUTE_DIRECTORY)) != 0 ||
            information.nNumberOfLinks != 1 || !liesAt(opened.get(), whole)) {
            return kAccessDenied;
        }
        file = portHandle<FileHandle>(opened.release());
        return kSuccess;
    }

    Status write(FileHandle file, std::string_view data, std::uint32_t& written) override {
        DWORD count = 0;
        const Status status =
            statusOfCall(WriteFile(native(file), data.data(), static_cast<DWORD>(data.size()), &count, nullptr));
        written = count;
        return status;
    }

    Status closeFile(FileHandle file) override { return statusOfCall(CloseHandle(native(file))); }

    Status writeFile(std::string_view path, std::string_view content, bool replace) override {
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
        file.receive() = portHandle<FileHandle>(opened);
        Status status = writeAll(file.get(), content);
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

    Status listFiles(std::string_view folder, std::vector<std::string>& names) override {
        if (namesNothing(folder)) {
            return kFileNotFound;
        }
        WIN32_FIND_DATAW found{};
        const FileSearch search =
            owned<FileSearch>(FindFirstFileW(WideText(std::string(folder) + "\\*").c_str(), &found));
        if (!search) {
            return GetLastError() == ERROR_PATH_NOT_FOUND ? kFileNotFound : GetLastError();
        }
        std::vector<std::string> files;
        do {
            if ((found.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) == 0) {
                files.push_back(textFromWide(found.cFileName));
            }
        } while (FindNextFileW(search.get(), &found) != FALSE);
        std::sort(files.begin(), files.end());
        names = std::move(files);
        return kSuccess;
    }
    Status productPath(std::string_view hostPath, std::string& path) override {
        std::string whole = wholePath(hostPath);
        if (namesNothing(whole)) {
            return kInvalidName;
        }
        path = std::move(whole);
        return kSuccess;
    }

    std::string shownPath(std::string_view path) override { return std::string(path); }

private:
    Status writeAll(FileHandle file, std::string_view content) {
        while (!content.empty()) {
            std::uint32_t written = 0;
            if (const Status status = write(file, content.substr(0, kWritePiece), written); status != kSuccess) {
                return status;
            }
            content.remove_prefix(written);
        }
        return statusOfCall(FlushFileBuffers(native(file)));
    }
};

}  // namespace

std::unique_ptr<IFileSystem> windowsFiles() {
    return std::make_unique<WindowsFileSystem>();
}

}  // namespace kz7
