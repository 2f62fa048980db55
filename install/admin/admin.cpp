#include "install/admin/admin.h"

#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kProgram = "kz7admin";
constexpr std::size_t kPiece = 1 << 16;  // bytes written out at once

}  // namespace

bool Admin::open(bool readOnly) {
    platform_ = hostPlatform({.program = std::string(kProgram),
                              .stateDirectory = storeDirectory,
                              .readOnly = readOnly,
                              .plainStreams = true});
    if (!storeDirectory.empty() && !platform_->storeIsOwn()) {
        fault("--store: the store of this machine is its registry, in no directory");
        return false;
    }
    return true;
}

Answer Admin::selectKeys(const std::string& key, std::vector<KeyStart>& starts) {
    if (key.empty()) {
        const Status status = findEverything(registry(), platform_->storeIsOwn(), starts);
        return status == kSuccess ? kAnswerYes : storeFault("the registry cannot be read", status);
    }
    const KeyName name = typedKeyName(key);
    const std::string shown = shownText(fullKeyName(name));
    if (checkKeyPath(name.path) != kSuccess) {
        return fault(shown + ": no key can be named so");
    }
    KeyStart start;
    const Status status = findKey(registry(), name, start);
    if (isNotFound(status)) {
        return no(shown + ": there is no such key");
    }
    starts.push_back(std::move(start));
    return status == kSuccess ? kAnswerYes : storeFault(shown + ": cannot be read", status);
}

Answer Admin::showKeys(const std::string& key, std::string head, const Appender& append, std::string_view tail) {
    std::vector<KeyStart> starts;
    if (const Answer selected = selectKeys(key, starts); selected != kAnswerYes) {
        return selected;
    }
    std::string text = std::move(head);
    Answer written = kAnswerYes;
    bool shown = false;
    for (const KeyStart& start : starts) {
        const Status status = walkKeys(registry(), start, [&](const KeyRecord& record) {
            if (isBareRoot(record) && !record.hasSubkeys) {
                return kSuccess;
            }
            shown = true;
            append(record, text);
            if (text.size() > kPiece) {
                written = write(text);
                text.clear();
            }
            return written == kAnswerYes ? kSuccess : kWriteFault;
        });
        if (status != kSuccess) {
            return written != kAnswerYes ? written
                                         : storeFault(shownText(fullKeyName(start.name)) + ": cannot be read", status);
        }
    }
    text += tail;
    written = write(text);
    return written != kAnswerYes || shown ? written
                                          : no(shownText(platform_->storeName()) + ": there is nothing to show");
}

std::string Admin::storeLine() {
    std::string line = "store " + shownText(platform_->storeName());
    if (const std::string note = platform_->storeNote(); !note.empty()) {
        line += " (" + note + ")";
    }
    return line;
}

void Admin::tell(std::string_view message) {
    platform_->console().writeError(compose("%s: %s\n", {kProgram, message}));
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

Answer Admin::write(std::string_view text) {
    IConsole& console = platform_->console();
    const bool written = console.writeOutput(text) == kSuccess && console.flush() == kSuccess;
    return written ? kAnswerYes : fault("standard output takes no more");
}

}  // namespace kz7
