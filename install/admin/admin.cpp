#include "install/admin/admin.h"

#include <array>
#include <cstdio>
#include <utility>

#include "install/platform/encoding.h"
#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kProgram = "kz7admin";
constexpr std::size_t kPage = 1 << 16;  // bytes that are shown at once

}  // namespace

bool Admin::openExisting(bool readOnly) {
    if (!open(readOnly)) {
        return false;
    }
    const bool isThere = !platform_->storeIsLost();
    if (!isThere) {
        fault("no store: " + shownText(platform_->storeName()));
    }
    return isThere;
}

bool Admin::open(bool readOnly, bool missingIsEmpty) {
    readOnly_ = readOnly;
    PlatformOptions options = platformOptions();
    options.stateDirectory = storeDirectory;
    options.readOnly = readOnly;
    options.missingIsEmpty = missingIsEmpty;
    options.plainStreams = true;
    platform_ = hostPlatform(options);
    if (!storeDirectory.empty() && !platform_->storeIsOwn()) {
        fault("cannot open store: --store: the store of this machine is its registry");
        return false;
    }
    return true;
}

PlatformOptions Admin::platformOptions() {
    return {.program = std::string(kProgram), .tellFault = [this](const std::string& line, Status status) {
                storeStatus_ = status;
                tell(line);
            }};
}

void Admin::beginRun(bool startsPrograms, std::uint64_t undoes) {
    if (IHistory* const history = platform_->history(); history != nullptr) {
        HistoryStart start{std::string(kProgram), arguments, startsPrograms, undoes};
        history->begin(start);
    }
}

void Admin::endRun(int result) {
    if (platform_ != nullptr && platform_->history() != nullptr && !readOnly_) {
        platform_->history()->end(static_cast<Status>(result == kAnswerChanged ? kAnswerYes : result));
    }
}

Answer Admin::selectKeys(const std::string& key, std::vector<KeyStart>& starts) {
    if (key.empty()) {
        const Status status = findEverything(registry(), platform_->storeIsOwn(), starts);
        return status == kSuccess ? kAnswerYes : storeFault("cannot read registry", status);
    }
    const KeyName name = typedKeyName(key);
    const std::string shown = shownText(fullKeyName(name));
    if (checkKeyPath(name.path) != kSuccess) {
        return fault("invalid key name: " + shown);
    }
    KeyStart start;
    const Status status = findKey(registry(), name, start);
    if (isNotFound(status)) {
        return no("no such key: " + shown);
    }
    starts.push_back(std::move(start));
    return status == kSuccess ? kAnswerYes : storeFault("cannot read key: " + shown, status);
}

// The state of showKeys().
struct Admin::Showing {
    std::string text;
    const Appender& append;
    Reading reading;
    Answer written = kAnswerYes;
    Answer outcome = kAnswerNo;
};

Status Admin::showKey(const KeyRecord& record, Showing& showing) {
    if (record.status != kSuccess) {
        showing.outcome = storeFault("cannot read key: " + shownText(record.name), record.status);
        if (platform_->storeFaultTold()) {
            return record.status;
        }
    } else if (isBareRoot(record) && !record.hasSubkeys) {
        return kSuccess;
    }
    showing.outcome = showing.outcome == kAnswerNo ? kAnswerYes : showing.outcome;
    showing.append(record, showing.text);
    if (showing.reading == Reading::pages && showing.text.size() > kPage) {
        showing.written = show(showing.text);
        showing.text.clear();
    }
    return showing.written == kAnswerYes ? kSuccess : kWriteFault;
}

Answer Admin::showKeys(const std::string& key, std::string text, const Appender& append, std::string_view tail,
                       Reading reading) {
    std::vector<KeyStart> starts;
    if (const Answer selected = selectKeys(key, starts); selected != kAnswerYes) {
        return selected;
    }
    Showing showing{std::move(text), append, reading};
    for (const KeyStart& start : starts) {
        const Status status =
            walkKeys(registry(), start, [&](const KeyRecord& record) { return showKey(record, showing); });
        if (status != kSuccess) {
            return showing.written != kAnswerYes
                       ? showing.written
                       : storeFault("cannot read key: " + shownText(fullKeyName(start.name)), status);
        }
    }
    const Answer written = show(showing.text.append(tail), reading == Reading::snapshot ? Form::document : Form::text);
    if (written == kAnswerYes && showing.outcome == kAnswerNo) {
        tell("nothing to show: " + shownText(platform_->storeName()));
    }
    return written != kAnswerYes ? written : showing.outcome;
}

Answer Admin::show(std::string_view text, Form form) {
    if (!text.empty() && !isJson && !std::exchange(storeTold_, true)) {
        tell(storeLine());
    }
    return write(text, form);
}

std::string Admin::storeLine() {
    std::string line = "store " + shownText(platform_->storeName());
    if (const std::string note = platform_->storeNote(); !note.empty()) {
        line += " (" + note + ")";
    }
    return line;
}

void Admin::tell(std::string_view message) {
    const std::string line = compose("%s: %s\n", {kProgram, message});
    if (isJson) {
        told_.append(told_.empty() ? "" : "\n").append(message);
    } else if (platform_ != nullptr) {
        platform_->console().writeError(line);
    } else {
        std::fputs(narrowFromText(line).c_str(), stderr);
    }
}

void Admin::endErrors(int exitCode) {
    if (!told_.empty()) {
        JsonWriter json = beginDocument();
        json.field("error", told_).field("exitCode", static_cast<std::uint32_t>(exitCode));
        if (storeStatus_ != kSuccess) {
            json.field("status", storeStatus_);
        }
        json.end();
        std::fputs(json.take().c_str(), stderr);
    }
}

Answer Admin::writeJson(JsonWriter& json) {
    return write(json.end().take(), Form::document);
}

Answer Admin::no(std::string_view message) {
    tell(message);
    return kAnswerNo;
}

Answer Admin::fault(std::string_view message) {
    tell(message);
    return kAnswerFault;
}

Answer Admin::storeFault(std::string_view what, Status status) {
    if (!platform_->storeFaultTold()) {
        tell(compose("%s: error %u", {what, status}));
    }
    return kAnswerFault;
}

Answer Admin::findFile(std::string_view what, const std::string& file, std::string& path) {
    const Status status = platform_->files().productPath(file, path);
    if (status != kSuccess || platform_->isStoreFile(file)) {
        return fault(compose("cannot write %s: %s: %s",
                             {what, shownText(file), status != kSuccess ? reasonOf(status) : "part of a store"}));
    }
    return kAnswerYes;
}

Answer Admin::checkFile(std::string_view what, const std::string& file) {
    std::string path;
    return findFile(what, file, path);
}

Answer Admin::writeFile(std::string_view what, const std::string& file, std::string_view content, bool replace) {
    std::string path;
    if (const Answer found = findFile(what, file, path); found != kAnswerYes) {
        return found;
    }
    const Status status = platform_->files().writeFile(path, content, replace);
    return status == kSuccess ? kAnswerYes
                              : fault(compose("cannot write %s: %s: %s", {what, shownText(file), reasonOf(status)}));
}

std::string reasonOf(Status status) {
    // clang-format off
    static constexpr std::array<std::pair<Status, std::string_view>, 7> kReasons = {{
        {kFileExists,           "file exists (--force replaces it)"},
        {kPathNotFound,         "no such directory"},
        {kBadPathname,          "not a regular file"},
        {kAccessDenied,         "permission denied"},
        {kDiskFull,             "no space left on device"},
        {kInvalidName,          "no file can have this name"},
        {kFilenameExceedsRange, "the name is too long"},
    }};
    // clang-format on
    for (const auto& [number, reason] : kReasons) {
        if (number == status) {
            return std::string(reason);
        }
    }
    return compose("error %u", {status});
}

Answer Admin::write(std::string_view text, Form form) {
    if (readOnly_) {
        registry().commit();
    }
    IConsole& console = platform_->console();
    Status status = kPipeClosing;
    if (!readerGone_) {
        status = form == Form::document ? console.writeDocument(text) : console.writeOutput(text);
    }
    if (status == kSuccess) {
        status = console.flush();
    }
    readerGone_ = status == kPipeClosing;
    return status == kSuccess || readerGone_ ? kAnswerYes
                                             : fault(compose("cannot write: standard output: error %u", {status}));
}

}  // namespace kz7
