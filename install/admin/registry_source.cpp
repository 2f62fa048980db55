#include "install/admin/registry_source.h"

#include <algorithm>
#include <charconv>
#include <filesystem>
#include <set>

#include "install/admin/formats/reg_text.h"
#include "install/admin/input_file.h"
#include "install/admin/run_history.h"
#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kStoreMark = "SQLite format 3";

bool removes(const KeyChange& change) {
    return change.remove || std::any_of(change.values.begin(), change.values.end(),
                                        [](const ValueChange& value) { return value.remove; });
}

// A key of the product that a text does not name although it names keys below it, or nothing.
std::string unnamedKey(IRegistryStore& registry, const std::vector<KeyChange>& changes) {
    std::set<std::string> named;
    for (const KeyChange& change : changes) {
        named.insert(walkPlace(fullKeyName(change.name)));
    }
    std::vector<KeyStart> starts;
    findEverything(registry, false, starts);
    const auto part = std::find_if(starts.begin(), starts.end(), [&](const KeyStart& start) {
        return !named.contains(walkPlace(fullKeyName(start.name)));
    });
    return part == starts.end() ? "" : fullKeyName(part->name);
}

// Why a text may not be the whole of an export, or nothing.
std::string doubtOf(IRegistryStore& registry, const std::vector<KeyChange>& changes, bool isCutOff) {
    if (isCutOff) {
        return "the last line has no end: the file was cut off";
    }
    if (std::any_of(changes.begin(), changes.end(), removes)) {
        return "removes keys or values, as no export does: kz7admin import takes it";
    }
    const std::string part = unnamedKey(registry, changes);
    return part.empty() ? part : "only a part of " + part + ": kz7admin import takes it";
}

}  // namespace

Answer RegistrySource::open() {
    if (place_ == ".") {
        registry_ = &admin_.registry();
        isOwn_ = admin_.platform().storeIsOwn();
        return kAnswerYes;
    }
    if (std::uint64_t number = 0; place_.starts_with('@')) {
        const char* const end = place_.data() + place_.size();
        const auto [stop, error] = std::from_chars(place_.data() + 1, end, number);
        return error == std::errc{} && stop == end ? openBefore(number)
                                                   : admin_.fault("not a run: " + shownText(place_));
    }
    if (std::error_code ignored; std::filesystem::is_directory(place_, ignored)) {
        return openStore(&PlatformOptions::stateDirectory);
    }
    InputFile file(admin_, place_);
    if (const Answer answer = file.read(); answer != kAnswerYes) {
        return answer;
    }
    if (file.bytes().starts_with(kStoreMark)) {
        return openStore(&PlatformOptions::backup);
    }
    using namespace std::string_view_literals;
    const bool isCutOff = !file.bytes().ends_with('\n') && !file.bytes().ends_with("\n\0"sv);
    std::vector<KeyChange> changes;
    TextFault bad;
    if (!parseRegText(file.bytes(), changes, bad)) {
        return file.badLine(bad.line, bad.reason);
    }
    std::uint32_t line = 0;
    const Status status = applyChanges(memory_, changes, line);
    registry_ = &memory_;
    doubt_ = status == kSuccess ? doubtOf(memory_, changes, isCutOff) : "";
    return status == kSuccess ? kAnswerYes
                              : admin_.fault(compose("cannot read: %s:%u: error %u", {file.shown(), line, status}));
}

Answer RegistrySource::examine() {
    if (!doubt_.empty()) {
        return admin_.fault(shownText(place_) + ": " + doubt_);
    }
    std::vector<std::string> damages;
    const Status status = platform_ == nullptr ? kSuccess : platform_->examineStore(damages);
    if (platform_ != nullptr) {
        registry().commit();  // the end of its transaction
    }
    if (status != kSuccess) {
        return kAnswerFault;  // told by the platform
    }
    return damages.empty() ? kAnswerYes : admin_.fault(shownText(place_) + ": damaged: " + shownText(damages.front()));
}

// Takes the runs back in memory, the last one first.
Answer RegistrySource::openBefore(std::uint64_t number) {
    isOwn_ = admin_.platform().storeIsOwn();
    registry_ = &admin_.registry();
    HistoryRun run;
    std::vector<HistoryRun> runs;
    Snapshot now;
    Answer answer = findRun(admin_, number, run);
    answer = answer == kAnswerYes ? listRuns(admin_, runs) : answer;
    answer = answer == kAnswerYes ? (isOwn_ ? read({}, true, now) : readProduct(false, now)) : answer;
    if (answer != kAnswerYes) {
        return answer;
    }
    registry_ = &memory_;
    std::string key;
    const Status status = applyChangeSet(memory_, nullptr, difference({}, now), key);
    answer = status == kSuccess ? kAnswerYes : admin_.storeFault("cannot go back: " + shownText(key), status);
    for (auto each = runs.rbegin(); answer == kAnswerYes && each != runs.rend() && each->number >= number; ++each) {
        answer = takeBack(*each, number);
    }
    return answer;
}

// One of the runs from `number` on.
Answer RegistrySource::takeBack(const HistoryRun& run, std::uint64_t number) {
    ChangeSet changes;
    std::vector<const Change*> conflicts;
    std::string key;
    if (const Answer read = readInverse(admin_, run, changes); read != kAnswerYes) {
        return read;
    }
    Status status = findConflicts(memory_, isOwn_, changes, conflicts, key);
    if (!conflicts.empty()) {
        return admin_.no("the history does not reach back to run " + std::to_string(number) +
                         ": other programs changed what run " + std::to_string(run.number) + " changed");
    }
    status = status == kSuccess ? applyChangeSet(memory_, nullptr, changes, key) : status;
    return status == kSuccess ? kAnswerYes : admin_.storeFault("cannot go back: " + shownText(key), status);
}

Answer RegistrySource::openStore(std::string PlatformOptions::*place) {
    PlatformOptions options = admin_.platformOptions();
    options.*place = place_;
    options.readOnly = true;
    options.ownProcess = false;
    platform_ = hostPlatform(options);
    if (!platform_->storeIsOwn()) {
        return admin_.fault(shownText(place_) + ": a store of another platform");
    }
    if (std::error_code ignored; !std::filesystem::exists(platform_->storeName(), ignored)) {
        return admin_.fault("no store: " + shownText(place_));
    }
    registry_ = &platform_->registry();
    return kAnswerYes;
}

Answer RegistrySource::read(const std::string& key, bool wholeServices, Snapshot& snapshot) {
    std::vector<KeyStart> starts;
    if (key.empty()) {
        return readFrom(starts, findEverything(registry(), isOwn_, starts), wholeServices, snapshot);
    }
    const KeyName name = typedKeyName(key);
    if (checkKeyPath(name.path) != kSuccess) {
        return admin_.fault("invalid key name: " + shownText(fullKeyName(name)));
    }
    KeyStart start;
    Status found = findKey(registry(), name, start);
    if (found == kSuccess) {
        starts.push_back(std::move(start));
    }
    return readFrom(starts, isNotFound(found) ? kSuccess : found, wholeServices, snapshot);
}

Answer RegistrySource::readProduct(bool wholeServices, Snapshot& snapshot) {
    std::vector<KeyStart> starts;
    const Status found = findEverything(registry(), false, starts);
    return readFrom(starts, found, wholeServices, snapshot);
}

Answer RegistrySource::readFrom(const std::vector<KeyStart>& starts, Status found, bool wholeServices,
                                Snapshot& snapshot) {
    std::string unread = place_;
    const Status status = found == kSuccess ? readSnapshot(registry(), wholeServices, starts, snapshot, unread) : found;
    if (platform_ != nullptr) {
        registry().commit();  // the end of its transaction
    }
    if (status == kSuccess || (platform_ != nullptr && platform_->storeFaultTold())) {
        return status == kSuccess ? kAnswerYes : kAnswerFault;
    }
    return admin_.storeFault("cannot read: " + shownText(unread), status);
}

}  // namespace kz7
