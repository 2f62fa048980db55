#include "install/admin/registry_source.h"

#include <filesystem>

#include "install/admin/formats/reg_text.h"
#include "install/admin/input_file.h"
#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kStoreMark = "SQLite format 3";

}  // namespace

Answer RegistrySource::open() {
    if (place_ == ".") {
        registry_ = &admin_.registry();
        isOwn_ = admin_.platform().storeIsOwn();
        return kAnswerYes;
    }
    if (std::error_code ignored; std::filesystem::is_directory(place_, ignored)) {
        return openStore({.program = "kz7admin", .stateDirectory = place_, .readOnly = true, .ownProcess = false});
    }
    InputFile file(admin_, place_);
    if (const Answer answer = file.read(); answer != kAnswerYes) {
        return answer;
    }
    if (file.bytes().starts_with(kStoreMark)) {
        return openStore({.program = "kz7admin", .backup = place_, .readOnly = true, .ownProcess = false});
    }
    std::vector<KeyChange> changes;
    TextFault bad;
    if (!parseRegText(file.bytes(), changes, bad)) {
        return file.badLine(bad.line, bad.reason);
    }
    std::uint32_t line = 0;
    const Status status = applyChanges(memory_, changes, line);
    registry_ = &memory_;
    return status == kSuccess ? kAnswerYes
                              : admin_.fault(compose("cannot read: %s:%u: error %u", {file.shown(), line, status}));
}

Answer RegistrySource::openStore(const PlatformOptions& options) {
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
