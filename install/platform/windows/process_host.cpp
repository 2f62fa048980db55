#include "install/platform/windows/ports.h"

#include <windows.h>

#include <algorithm>
#include <initializer_list>
#include <string>
#include <vector>

#include "install/platform/command_line.h"
#include "install/platform/registry_path.h"
#include "install/platform/windows/native_handle.h"
#include "install/platform/windows/paths.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

DWORD slotNumber(StandardSlot slot) {
    return slot == StandardSlot::output ? STD_OUTPUT_HANDLE : STD_ERROR_HANDLE;
}

// Takes the next folder off a search path. A folder in quotation marks may contain a semicolon; the marks are not part
// of its name.
std::wstring takeFolder(std::wstring_view& path) {
    std::wstring folder;
    std::size_t at = 0;
    for (bool isQuoted = false; at < path.size() && (isQuoted || path[at] != L';'); ++at) {
        if (path[at] == L'"') {
            isQuoted = !isQuoted;
        } else {
            folder += path[at];
        }
    }
    path.remove_prefix(std::min(at + 1, path.size()));
    return folder;
}

// The absolute folders of a search path, without those with a semicolon in their name, which the system would split.
std::wstring absoluteFolders(std::wstring_view path) {
    std::wstring kept;
    while (!path.empty()) {
        const std::wstring folder = takeFolder(path);
        if (isAbsolutePath(textFromWide(folder.substr(0, 3))) && folder.find(L';') == std::wstring::npos) {
            kept += folder + L';';
        }
    }
    return kept;
}

// While it lives, the system does not search the current folder for a program, where another user could place one. A
// child gets the environment as it was before.
class SearchWithoutCurrentFolder {
public:
    SearchWithoutCurrentFolder() : environment_(GetEnvironmentStringsW()) {
        wasSet_ = GetEnvironmentVariableW(kSwitch, nullptr, 0) != 0;
        if (!wasSet_) {
            SetEnvironmentVariableW(kSwitch, L"1");
        }
        path_.resize(GetEnvironmentVariableW(kPath, nullptr, 0));
        path_.resize(GetEnvironmentVariableW(kPath, path_.data(), static_cast<DWORD>(path_.size())));
        SetEnvironmentVariableW(kPath, absoluteFolders(path_).c_str());
    }
    ~SearchWithoutCurrentFolder() {
        SetEnvironmentVariableW(kPath, path_.c_str());
        if (!wasSet_) {
            SetEnvironmentVariableW(kSwitch, nullptr);
        }
        if (environment_ != nullptr) {
            FreeEnvironmentStringsW(environment_);
        }
    }
    SearchWithoutCurrentFolder(const SearchWithoutCurrentFolder&) = delete;
    SearchWithoutCurrentFolder& operator=(const SearchWithoutCurrentFolder&) = delete;

    void* environment() const { return environment_; }

private:
    static constexpr const wchar_t* kSwitch = L"NoDefaultCurrentDirectoryInExePath";
    static constexpr const wchar_t* kPath = L"PATH";
    wchar_t* environment_;
    std::wstring path_;
    bool wasSet_ = false;
};

// Whether the system finds a program by its bare name: next to this program, in the system's folders or on the path.
bool isFoundByName(std::string_view program) {
    const std::string own = textOf([](wchar_t* room, DWORD size) { return GetModuleFileNameW(nullptr, room, size); });
    std::string folders = own.substr(0, own.find_last_of('\\'));
    for (const auto systemFolder : {GetSystemDirectoryW, GetWindowsDirectoryW}) {
        folders.append(";").append(textOf(systemFolder));
    }
    folders.append(";").append(environmentText("PATH"));
    return SearchPathW(WideText(folders).c_str(), WideText(program).c_str(), L".exe", 0, nullptr, nullptr) != 0;
}

// Whether the program that the system would choose depends on the current folder or drive. The system takes the first
// reading of which a file exists; after a bare name that is not found it may be "a b\c.exe".
bool dependsOnCurrentFolder(const std::vector<CommandReading>& readings) {
    for (const CommandReading& reading : readings) {
        if (!isBareName(reading.program)) {
            return !isAbsolutePath(reading.program);
        }
        if (isFoundByName(reading.program)) {
            return false;
        }
    }
    return false;
}

// The handles that a child inherits: its streams and no other inheritable handle of this process, which would stay open
// for as long as the child or a grandchild runs.
class InheritedHandles {
public:
    explicit InheritedHandles(std::initializer_list<StreamHandle> streams) {
        for (const StreamHandle stream : streams) {
            if (stream != StreamHandle::none &&
                std::find(handles_.begin(), handles_.end(), native(stream)) == handles_.end()) {
                handles_.push_back(native(stream));
            }
        }
        SIZE_T size = 0;
        InitializeProcThreadAttributeList(nullptr, 1, 0, &size);
        room_.resize(size);
        status_ = statusOfCall(InitializeProcThreadAttributeList(list(), 1, 0, &size));
        isMade_ = status_ == kSuccess;
        if (isMade_ && !handles_.empty()) {
            status_ =
                statusOfCall(UpdateProcThreadAttribute(list(), 0, PROC_THREAD_ATTRIBUTE_HANDLE_LIST, handles_.data(),
                                                       handles_.size() * sizeof(HANDLE), nullptr, nullptr));
        }
    }
    ~InheritedHandles() {
        if (isMade_) {
            DeleteProcThreadAttributeList(list());
        }
    }
    InheritedHandles(const InheritedHandles&) = delete;
    InheritedHandles& operator=(const InheritedHandles&) = delete;

    Status status() const { return status_; }
    bool any() const { return !handles_.empty(); }
    LPPROC_THREAD_ATTRIBUTE_LIST list() { return reinterpret_cast<LPPROC_THREAD_ATTRIBUTE_LIST>(room_.data()); }

private:
    std::vector<HANDLE> handles_;
    std::vector<char> room_;
    Status status_ = kSuccess;
    bool isMade_ = false;
};

class WindowsProcessHost final : public IProcessHost {
public:
    Status getSlot(StandardSlot slot, StreamHandle& stream) override {
        const HANDLE handle = GetStdHandle(slotNumber(slot));
        if (handle == INVALID_HANDLE_VALUE) {
            return GetLastError();
        }
        stream = portHandle<StreamHandle>(handle);
        return kSuccess;
    }

    Status setSlot(StandardSlot slot, StreamHandle stream) override {
        return statusOfCall(SetStdHandle(slotNumber(slot), native(stream)));
    }

    Status createPipe(StreamHandle& readEnd, StreamHandle& writeEnd) override {
        SECURITY_ATTRIBUTES inherited{sizeof inherited, nullptr, TRUE};
        HANDLE reading = nullptr;
        HANDLE writing = nullptr;
        const Status status = statusOfCall(CreatePipe(&reading, &writing, &inherited, 0));
        if (status == kSuccess) {
            readEnd = portHandle<StreamHandle>(reading);
            writeEnd = portHandle<StreamHandle>(writing);
        }
        return status;
    }

    Status duplicate(StreamHandle stream, StreamHandle& copy) override {
        HANDLE handle = nullptr;
        const Status status = statusOfCall(DuplicateHandle(GetCurrentProcess(), native(stream), GetCurrentProcess(),
                                                           &handle, 0, FALSE, DUPLICATE_SAME_ACCESS));
        if (status == kSuccess) {
            copy = portHandle<StreamHandle>(handle);
        }
        return status;
    }

    Status read(StreamHandle stream, Buffer& data) override {
        DWORD count = 0;
        const Status status = statusOfCall(ReadFile(native(stream), data.data, data.capacity, &count, nullptr));
        if (status == kSuccess) {
            data.size = count;
        }
        return status;
    }

    Status write(StreamHandle stream, std::string_view data) override {
        DWORD count = 0;
        return statusOfCall(WriteFile(native(stream), data.data(), static_cast<DWORD>(data.size()), &count, nullptr));
    }

    Status closeStream(StreamHandle stream) override { return statusOfCall(CloseHandle(native(stream))); }

    Status startProcess(const ProcessStart& start, ProcessInformation& started) override {
        const std::vector<CommandReading> readings = commandReadings(start.commandLine);
        const SearchWithoutCurrentFolder search;
        if (readings.empty() || dependsOnCurrentFolder(readings)) {
            return kFileNotFound;
        }
        const std::string directory(start.workingDirectory);
        if (!directory.empty() && !isAbsolutePath(directory)) {
            return kBadDirectory;
        }
        InheritedHandles inherited({start.output, start.error, start.input});
        if (inherited.status() != kSuccess) {
            return inherited.status();
        }
        STARTUPINFOEXW startup{};
        startup.StartupInfo.cb = sizeof startup;
        startup.StartupInfo.dwFlags = STARTF_USESTDHANDLES | STARTF_USESHOWWINDOW;
        startup.StartupInfo.wShowWindow = SW_HIDE;
        startup.StartupInfo.hStdInput = native(start.input);
        startup.StartupInfo.hStdOutput = native(start.output);
        startup.StartupInfo.hStdError = native(start.error);
        startup.lpAttributeList = inherited.list();
        WideText commandLine(start.commandLine);  // CreateProcess() writes into it
        PROCESS_INFORMATION information{};
        const Status status = statusOfCall(CreateProcessW(
            nullptr, commandLine.data(), nullptr, nullptr, inherited.any() ? TRUE : FALSE,
            NORMAL_PRIORITY_CLASS | CREATE_UNICODE_ENVIRONMENT | EXTENDED_STARTUPINFO_PRESENT, search.environment(),
            directory.empty() ? nullptr : WideText(directory).c_str(), &startup.StartupInfo, &information));
        if (status == kSuccess) {
            started = {portHandle<ProcessHandle>(information.hProcess), portHandle<ProcessHandle>(information.hThread),
                       information.dwProcessId, information.dwThreadId};
        }
        return status;
    }

    Status waitProcess(ProcessHandle process, std::uint32_t milliseconds) override {
        switch (WaitForSingleObject(native(process), milliseconds)) {
            case WAIT_OBJECT_0:
                return kSuccess;
            case WAIT_TIMEOUT:
                return kWaitTimedOut;
            default:
                return GetLastError();
        }
    }

    Status exitCode(ProcessHandle process, std::uint32_t& code) override {
        DWORD found = 0;
        const Status status = statusOfCall(GetExitCodeProcess(native(process), &found));
        if (status == kSuccess) {
            code = found;
        }
        return status;
    }

    Status closeProcess(ProcessHandle process) override { return statusOfCall(CloseHandle(native(process))); }

    Status shortPath(std::string_view path, Buffer& shortened) override {
        const WideText wide(path);
        DWORD error = kSuccess;
        const std::string found = textOf([&](wchar_t* room, DWORD size) {
            const DWORD length = GetShortPathNameW(wide.c_str(), room, size);
            error = length == 0 ? GetLastError() : kSuccess;
            return length;
        });
        return error != kSuccess ? error : giveName(found, shortened);
    }
};

}  // namespace

std::unique_ptr<IProcessHost> windowsProcesses() {
    return std::make_unique<WindowsProcessHost>();
}

}  // namespace kz7
