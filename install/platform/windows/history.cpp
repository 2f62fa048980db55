// The history port on Windows: a journal file for each run in %ProgramData%\KZ7\history, once that is switched on.
#include <algorithm>
#include <array>
#include <charconv>
#include <cstdio>
#include <ctime>

#include "install/platform/history.h"
#include "install/platform/text.h"
#include "install/platform/windows/ports.h"
#include "install/platform/windows/run_journal.h"
#include "install/platform/windows/trusted_folder.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

constexpr const wchar_t* kRunVariable = L"KZ7_RUN";  // for the programs that a run starts: its number
constexpr const wchar_t* kSwitch = L"\\on";
constexpr std::wstring_view kSuffix = L".run";
constexpr std::size_t kDigits = 10;
constexpr std::size_t kMostRuns = 1000;
constexpr std::uint64_t kMostBytes = std::uint64_t{256} << 20;

std::string machineId() {
    return textOf([](wchar_t* room, DWORD size) {
        DWORD bytes = size * static_cast<DWORD>(sizeof *room);
        const LSTATUS status = RegGetValueW(HKEY_LOCAL_MACHINE, L"SOFTWARE\\Microsoft\\Cryptography", L"MachineGuid",
                                            RRF_RT_REG_SZ, nullptr, room, &bytes);
        return status == ERROR_SUCCESS ? bytes / static_cast<DWORD>(sizeof *room) - 1 : 0;
    });
}

std::string environmentName(BOOL(WINAPI* call)(LPWSTR, LPDWORD)) {
    return textOf([&](wchar_t* room, DWORD size) {
        DWORD length = size;
        return call(room, &length) != FALSE ? static_cast<DWORD>(std::wcslen(room)) : 0;
    });
}

struct JournalFile {
    std::uint64_t number = 0;
    std::uint64_t size = 0;
};

class WindowsHistory final : public IHistory {
public:
    explicit WindowsHistory(IDebugOutput& debugOutput) : debugOutput_(debugOutput) {}

    bool isOn() override {
        if (!isKnown_) {
            isKnown_ = true;
            isOn_ = open(false) == kSuccess &&
                    GetFileAttributesW((folderName() + kSwitch).c_str()) != INVALID_FILE_ATTRIBUTES;
        }
        return isOn_;
    }

    Status turn(bool on) override {
        if (const Status status = open(on); status != kSuccess) {
            return on || !isNotFound(status) ? status : kSuccess;
        }
        const std::wstring name = folderName() + kSwitch;
        if (!on) {
            return DeleteFileW(name.c_str()) != FALSE || GetLastError() == ERROR_FILE_NOT_FOUND ? kSuccess
                                                                                                : GetLastError();
        }
        return openTrustedFile(name, FILE_WRITE_DATA, FILE_SHARE_READ, OPEN_ALWAYS) ? kSuccess : GetLastError();
    }

    void begin(const HistoryStart& run) override {
        static_cast<HistoryStart&>(run_) = run;
        run_.begun = std::time(nullptr);
    }

    bool takesEachChange() override { return true; }

    // The run goes on without its record.
    Status append(std::string part) override {
        if (!hasFailed_ && (file_ || create())) {
            write(writer_.record(JournalRecord::change, part));
        }
        return kSuccess;
    }

    Status settle(const ChangeCounts& counts) override {
        run_.counts = counts;
        if (file_ && FlushFileBuffers(file_.get()) == FALSE) {
            fail();
        }
        return kSuccess;
    }

    void note(std::string_view outside) override {
        if (file_) {
            write(writer_.record(JournalRecord::note, outside));
        } else {
            run_.outside.emplace_back(outside);
        }
    }

    void end(Status status) override {
        if (file_ && run_.counts.isEmpty()) {
            remove();
        } else if (file_) {
            write(journalEnd(writer_, status, std::time(nullptr), run_.counts));
            settle(run_.counts);
            file_.reset();
            removeOldest();
        }
    }

    Status list(std::vector<HistoryRun>& runs) override {
        const Status status = open(false);
        std::vector<HistoryRun> found;
        for (const JournalFile& file : status == kSuccess ? files() : std::vector<JournalFile>{}) {
            HistoryRun run;
            HistoryChanges ignored;
            std::string bytes;
            run.number = file.number;
            if (!read(run, bytes) || readJournal(bytes, machineId(), run, ignored) == kFileNotFound) {
                continue;
            }
            run.state = run.state == RunState::interrupted && isInUse(file.number) ? RunState::running : run.state;
            found.push_back(std::move(run));
        }
        runs = std::move(found);
        return isNotFound(status) ? kSuccess : status;
    }

    Status read(std::uint64_t number, HistoryChanges& changes) override {
        HistoryRun run;
        std::string bytes;
        run.number = number;
        if (const Status status = open(false); status != kSuccess) {
            return status;
        }
        return read(run, bytes) ? readJournal(bytes, machineId(), run, changes) : GetLastError();
    }

    Status trim(std::uint64_t number) override {
        Status status = open(false);
        const std::vector<JournalFile> all = status == kSuccess ? files() : std::vector<JournalFile>{};
        for (const JournalFile& file : all) {
            if (file.number < number && !drop(file.number, file.number == all.back().number)) {
                status = GetLastError() == ERROR_SHARING_VIOLATION ? status : GetLastError();
            }
        }
        return isNotFound(status) ? kSuccess : status;
    }

private:
    static std::wstring folderName() { return ownProgramData() + L"\\history"; }
    static std::wstring nameOf(std::uint64_t number) {
        std::wstring digits = std::to_wstring(number);
        digits.insert(0, digits.size() < kDigits ? kDigits - digits.size() : 0, L'0');
        return folderName() + L'\\' + digits + std::wstring(kSuffix);
    }

    // kFileNotFound: it was never switched on.
    Status open(bool create) {
        if (folder_) {
            return kSuccess;
        }
        const std::wstring data = ownProgramData();
        if (!create && GetFileAttributesW(folderName().c_str()) == INVALID_FILE_ATTRIBUTES) {
            const DWORD error = GetLastError();
            return error == ERROR_PATH_NOT_FOUND ? kFileNotFound : error;
        }
        parent_ = openTrustedFolder(data, create);
        folder_ = parent_ ? openTrustedFolder(folderName(), create) : nullptr;
        return folder_ ? kSuccess : kAccessDenied;
    }

    // The journals, the oldest first.
    static std::vector<JournalFile> files() {
        std::vector<JournalFile> files;
        WIN32_FIND_DATAW found{};
        const FileSearch search = owned<FileSearch>(FindFirstFileW((folderName() + L"\\*.run").c_str(), &found));
        bool isFound = search != nullptr;
        for (; isFound; isFound = FindNextFileW(search.get(), &found) != FALSE) {
            const std::string name = textFromWide(found.cFileName);
            std::uint64_t number = 0;
            const auto [end, error] = std::from_chars(name.data(), name.data() + name.size(), number);
            if (error == std::errc{} && number != 0 && nameOf(number).ends_with(found.cFileName)) {
                files.push_back({number, std::uint64_t{found.nFileSizeHigh} << 32 | found.nFileSizeLow});
            }
        }
        std::sort(files.begin(), files.end(),
                  [](const JournalFile& left, const JournalFile& right) { return left.number < right.number; });
        return files;
    }

    static bool read(const HistoryRun& run, std::string& bytes) {
        const NativeHandle file =
            openTrustedFile(nameOf(run.number), FILE_READ_DATA, FILE_SHARE_READ | FILE_SHARE_WRITE, OPEN_EXISTING);
        return file && readAll(file.get(), bytes) == kSuccess;
    }

    // A run keeps others from writing to its journal.
    static bool isInUse(std::uint64_t number) {
        return !openTrustedFile(nameOf(number), FILE_WRITE_DATA, FILE_SHARE_READ | FILE_SHARE_WRITE, OPEN_EXISTING) &&
               GetLastError() == ERROR_SHARING_VIOLATION;
    }

    bool create() {
        const std::vector<JournalFile> known = files();
        std::uint64_t number = known.empty() ? 1 : known.back().number + 1;
        for (;; ++number) {
            file_ = openTrustedFile(nameOf(number), FILE_APPEND_DATA, FILE_SHARE_READ, CREATE_NEW);
            if (file_ || GetLastError() != ERROR_FILE_EXISTS) {
                break;
            }
        }
        if (!file_) {
            fail();
            return false;
        }
        run_.number = number;
        run_.parent = parentRun();
        run_.user = environmentName(GetUserNameW);
        run_.host = environmentName(GetComputerNameW);
        write(journalHead(writer_, run_, machineId()));
        for (const std::string& outside : run_.outside) {
            write(writer_.record(JournalRecord::note, outside));
        }
        if (run_.startsPrograms) {
            SetEnvironmentVariableW(kRunVariable, std::to_wstring(number).c_str());
        }
        return !hasFailed_;
    }

    static std::uint64_t parentRun() {
        const std::string text =
            textOf([](wchar_t* room, DWORD size) { return GetEnvironmentVariableW(kRunVariable, room, size); });
        std::uint64_t number = 0;
        std::from_chars(text.data(), text.data() + text.size(), number);
        return number != 0 && isInUse(number) ? number : 0;
    }

    void write(const std::string& bytes) {
        DWORD written = 0;
        if (file_ &&
            (WriteFile(file_.get(), bytes.data(), static_cast<DWORD>(bytes.size()), &written, nullptr) == FALSE ||
             written != bytes.size())) {
            fail();
        }
    }

    // Half a record could be taken for a whole one.
    void fail() {
        debugOutput_.write(compose("the history cannot be written: error %u", {static_cast<Status>(GetLastError())}));
        hasFailed_ = true;
        remove();
    }

    void remove() {
        if (file_) {
            file_.reset();
            drop(run_.number, true);
        }
    }

    // The newest journal stays as an empty file, which is no run, so that no later run gets its number. False:
    // GetLastError() is the reason.
    static bool drop(std::uint64_t number, bool isNewest) {
        return isNewest ? openTrustedFile(nameOf(number), GENERIC_WRITE, FILE_SHARE_READ, TRUNCATE_EXISTING) != nullptr
                        : DeleteFileW(nameOf(number).c_str()) != FALSE;
    }

    static void removeOldest() {
        const std::vector<JournalFile> all = files();
        std::uint64_t bytes = 0;
        std::size_t kept = 0;
        for (auto file = all.rbegin(); file != all.rend(); ++file) {
            bytes += file->size;
            if (++kept > kMostRuns || bytes > kMostBytes) {
                drop(file->number, file == all.rbegin());
            }
        }
    }

    IDebugOutput& debugOutput_;
    NativeHandle parent_;
    NativeHandle folder_;
    NativeHandle file_;
    HistoryRun run_;
    JournalWriter writer_;
    bool isKnown_ = false;
    bool isOn_ = false;
    bool hasFailed_ = false;
};

}  // namespace

std::unique_ptr<IHistory> windowsHistory(IDebugOutput& debugOutput) {
    return std::make_unique<WindowsHistory>(debugOutput);
}

}  // namespace kz7
