#include "install/runtime/observers/log_observer.h"

#include <algorithm>
#include <array>
#include <new>

#include "install/platform/encoding.h"
#include "install/platform/registry_path.h"
#include "install/runtime/guarded.h"
#include "install/runtime/session_text.h"

namespace kz7 {
namespace {

constexpr std::size_t kMaxTitle = 44;       // characters
constexpr std::size_t kMaxDate = 42;        // characters
constexpr std::size_t kMaxSystemText = 79;  // characters
constexpr std::size_t kTextStep = 256;      // bytes by which the buffer of a text grows
constexpr std::size_t kKeptRoom = 1 << 16;  // bytes of capacity kept after a line
constexpr std::uint32_t kPrefixMask = 0x4000103;

constexpr std::string_view kSeparator = "============================================================";
static_assert(kSeparator.size() == 60);

// The kinds of run in the order of the test; the title numbers of each are 100 above those of the one before.
constexpr std::array kRuns = {kModeInstall, kModeUpdate, kModeRemove, kModeConfigure};

URELogObserver* theLog = nullptr;
FixedText<kPathSize> sharedLogPath;

std::string_view withoutQuotes(std::string_view text) {
    return text.size() >= 2 && text.front() == '"' && text.back() == '"' ? text.substr(1, text.size() - 2) : text;
}

// A text of the system as the log shows it.
std::string_view shownSystemText(std::string_view text) {
    return withoutQuotes(text.substr(0, kMaxSystemText));
}

}  // namespace

URELogObserver* URELogObserver::getInstance(URE& ure) {
    if (theLog == nullptr) {
        theLog = new (std::nothrow) URELogObserver(ure);
    }
    return theLog;
}

void URELogObserver::release() {
    delete theLog;
}

URELogObserver::~URELogObserver() {
    theLog = nullptr;
}

const char* URELogObserver::componentLogPath(char* buffer) const {
    if (buffer == nullptr) {
        sharedLogPath = componentLogPath_;
        return sharedLogPath.c_str();
    }
    const std::string_view path = componentLogPath_.view();
    buffer[path.copy(buffer, path.size())] = '\0';
    return buffer;
}

Status URELogObserver::setLogFile(std::string_view path) {
    const Status status = guarded([&] { return openLog(path); });
    if (status == kNoMemory) {
        ure_.error(kCodeError, "URELogObserver::setLogFile", 20, kNoMemory);
    }
    return status;
}

Status URELogObserver::openLog(std::string_view path) {
    const std::string_view folder = path.substr(0, path.find_last_of('\\') + 1);
    TextBuffer<kPathSize> shortened;
    file_.reset();
    shortPathFailed_ = false;
    const Status found = shortFolder(folder, shortened);
    if (found != kSuccess) {
        // Deliberate: nothing is reported and only plain notes are written from here on; a log that cannot be kept must
        // not stop an installer.
        shortPathFailed_ = true;
        return found;
    }
    componentLogPath_.assign(shortened.view());
    componentLogPath_.append(kLogFileName);
    const bool whole = logFilePath_.assign(path);
    const Status opened =
        whole ? ure_.ports.files.openForAppend(logFilePath_.view(), file_.receive()) : kFilenameExceedsRange;
    if (opened != kSuccess) {
        ure_.error(kCodeError, "URELogObserver::setLogFile", 10, opened);
    }
    writeHeader(false);
    describeSystem();
    lookForClusterLog(folder);
    return opened;
}

Status URELogObserver::shortFolder(std::string_view folder, Buffer& shortened) {
    const Status status = ure_.ports.processes.shortPath(folder, shortened);
    if (status != kCallNotImplemented) {
        return status;
    }
    // On a host without short paths an existing folder is its own short form.
    if (folder.empty() || giveName(folder, shortened) != kSuccess) {
        return kBadPathname;
    }
    return ure_.ports.files.probe(folder);
}

Status URELogObserver::writeHeader(bool isEnd) {
    writeLine({});
    FixedText<kMaxTitle + kMaxDate + 1> title;
    const auto* run =
        std::find_if(kRuns.begin(), kRuns.end(), [&](std::uint32_t bit) { return (ure_.mode & bit) != 0; });
    if (run != kRuns.end()) {
        char room[kBytesOfCharacter * kMaxTitle];
        std::size_t length = 0;
        const auto number = kHeaderTitles + static_cast<std::uint32_t>(100 * (run - kRuns.begin())) + (isEnd ? 1 : 0);
        const Status status = ure_.messages.copyText(number, {}, room, sizeof room, length);
        if (status != kSuccess && status != kBufferTooSmall) {
            return status;
        }
        title.assign(withoutQuotes(cutText({room, std::min(length, sizeof room)}, kMaxTitle)));
    }
    TextBuffer<256> date;
    if (guarded([&] { return ure_.ports.host.localTime(TimeText::dateAndZone, date); }) == kSuccess) {
        title.append(cutText(date.view(), kMaxDate));
    }
    writeLine(title.view());
    return writeLine(kSeparator);
}

// A system that cannot be identified leaves all three texts empty.
void URELogObserver::describeSystem() {
    OperatingSystem system;
    ure_.ports.host.operatingSystem(system);
    systemName_.assign(shownSystemText(system.name));
    systemVersion_.assign(shownSystemText(system.version));
    systemVersion_.append(".");
    systemVersion_.append(shownSystemText(system.release));
    writeLine(compose("%s %s", {systemName_.view(), systemVersion_.view()}));
}

void URELogObserver::lookForClusterLog(std::string_view folder) {
    std::string pattern(folder.substr(0, folder.size() - 1));
    pattern += (ure_.mode & kModeRemove) != 0 ? "\\uninstallSAM.????.log" : "\\installSAM.????.log";
    std::string name;
    findFile(ure_.ports.files, pattern, name);
}

void URELogObserver::writeFunction(std::string_view text) {
    stampsTime_ = true;
    ure_.report(kCodeReport, "writeFunction", 10, kSuccess, text);
    stampsTime_ = false;
}

Status URELogObserver::writeLine(std::string_view text) {
    return guarded([&] {
        line_.assign(text);
        return writeKeptLine();
    });
}

Status URELogObserver::writeKeptLine() {
    if (!file_) {
        return writeToSession(line_);
    }
    // The port does not buffer: there is nothing to flush.
    line_ += '\n';
    const std::string narrow = narrowFromText(line_);
    std::uint32_t written = 0;
    ure_.ports.files.write(file_.get(), narrow, written);
    const bool whole = written == narrow.size();
    if (line_.capacity() > kKeptRoom) {
        std::string().swap(line_);
    }
    // Deliberate: the result of a short write is its count; callers know from the operation that it is not a status.
    return whole ? kSuccess : written != 0 ? written : kFailed;
}

Status URELogObserver::writeToSession(std::string_view text) {
    IInstallerSession* session = ure_.ports.session;
    if (session == nullptr) {
        return kNoInstallerSession;
    }
    // The session's results are ignored: no other place could take the line.
    OwnedSessionHandle record(*session);
    if (session->createRecord(1, record.receive()) == kSuccess) {
        std::int32_t answer = 0;
        session->setRecordString(record.get(), 1, escapedForSession(text));
        session->processMessage(kSessionInfo, record.get(), answer);
    }
    return kSuccess;
}

Status URELogObserver::update(UREBaseInfo& info) {
    return guarded([&] {
        if (info.getInfoType() == InfoType::message) {
            return writeInfo(static_cast<const UREInfo&>(info));
        }
        FixedText<kMessageSize> description;
        static_cast<const UREProgressInfo&>(info).copyDescription(description);
        return description.empty() || shortPathFailed_ ? kSuccess : writeLine(description.view());
    });
}

std::string_view URELogObserver::prefixOf(const UREInfo& info, Buffer& time) {
    switch (info.code() & kPrefixMask) {
        case kTraceError:
            return ure_.messages.pattern(kNotePrefix);
        case kCodeError:
            return ure_.messages.pattern(kErrorPrefix);
        case kCodeWarning:
            return ure_.messages.pattern(kWarningPrefix);
        case kCodeReport:
            if (stampsTime_ && ure_.ports.host.localTime(TimeText::timeOfDay, time) == kSuccess) {
                // Deliberate: no blank follows the time; only prefixes end in a separator.
                return time.view();
            }
            return {};
        default:
            return {};
    }
}

Status URELogObserver::writeInfo(const UREInfo& info) {
    if (shortPathFailed_ && info.code() != kTraceError) {
        return kSuccess;
    }
    FixedBuffer<16> time;
    line_.assign(shortPathFailed_ ? std::string_view{} : prefixOf(info, time));
    const std::size_t prefix = line_.size();
    std::size_t length = 0;
    Status status = kBufferTooSmall;
    for (std::size_t room = kTextStep; status == kBufferTooSmall;) {
        line_.resize(prefix + room);
        status = info.copyText(line_.data() + prefix, room, length);
        // The lookup returns the needed length: all steps up to it are taken at once.
        room += std::max<std::size_t>(1, (std::max(length, room) - room + kTextStep - 1) / kTextStep) * kTextStep;
    }
    if (status == kNoInstallerSession) {
        FixedText<kMessageSize> missing;
        info.copyMissingText(missing);
        line_.replace(prefix, std::string::npos, missing.view());
    } else if (status != kSuccess) {
        return status;
    } else {
        line_.resize(prefix + length);
        const std::string_view text = withoutQuotes(std::string_view(line_).substr(prefix));
        if (text.size() != length) {
            line_.pop_back();
            line_.erase(prefix, 1);
        }
    }
    return writeKeptLine();
}

}  // namespace kz7
