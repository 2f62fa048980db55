#include "install/admin/ensurer.h"

#include <algorithm>
#include <optional>
#include <set>

#include "install/admin/copy_location.h"
#include "install/platform/shown_text.h"
#include "install/platform/text.h"
#include "install/src/add_copy.h"
#include "install/src/registry/change_set.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/copy_name.h"
#include "install/src/remove_copy.h"
#include "install/src/services/management_service.h"
#include "install/src/uselvlkz7reg.h"

namespace kz7 {

std::string Ensurer::plan(const std::vector<WantedCopy>& wanted) {
    if (std::string other = otherSpelling(wanted); !other.empty()) {
        return other;
    }
    InstallCopyList list(*ports_.registry, *ports_.debugOutput, false, false);
    left_ = findRemovals(list, wanted);
    const auto absent =
        std::find_if(wanted.begin(), wanted.end(), [](const WantedCopy& copy) { return !copy.isPresent; });
    const bool removes = choices_.prune || absent != wanted.end();
    if (const std::string unread = removes ? unreadCopy(list) : std::string{}; !unread.empty()) {
        return compose("cannot remove %s: %s",
                       {absent == wanted.end() ? "copies" : shownText(absent->name), shownText(unread)});
    }
    if (removals_.empty() || left_ != 0 || (choices_.prune && choices_.all)) {
        return {};
    }
    return "cannot remove " + shownText(removals_.back()) +
           ": the last copy takes the whole product along (--prune --all removes it)";
}

// A host that folds the case of more letters than we do has one copy where we see two.
std::string Ensurer::otherSpelling(const std::vector<WantedCopy>& wanted) {
    std::set<std::string> subkeys;  // folded
    OwnedKey copies(*ports_.registry);
    std::vector<Subkey> found;
    if (ports_.registry->openKey(KeyHandle::localMachine, layout::kCopies, kKeyWalk, copies.receive()) == kSuccess &&
        reader_.subkeys(copies.get(), found) == kSuccess) {
        for (const Subkey& key : found) {
            subkeys.insert(foldUpper(key.name));
        }
        for (const WantedCopy& copy : wanted) {
            OwnedKey key(*ports_.registry);
            if (!subkeys.contains(foldUpper(copy.name)) &&
                ports_.registry->openKey(copies.get(), copy.name, kKeyQueryValue, key.receive()) == kSuccess) {
                return "copy " + shownText(copy.name) + " is installed under another spelling of its name";
            }
        }
    }
    return {};
}

// Why the list is not known to be whole; empty if it is.
std::string Ensurer::unreadCopy(InstallCopyList& list) {
    OwnedKey copies(*ports_.registry);
    std::vector<Subkey> subkeys;
    Status status = ports_.registry->openKey(KeyHandle::localMachine, layout::kCopies, kKeyWalk, copies.receive());
    if (isNotFound(status)) {
        return {};
    }
    status = status == kSuccess ? reader_.subkeys(copies.get(), subkeys) : status;
    if (status != kSuccess || list.status() != 0) {
        return "the list of copies cannot be read whole";
    }
    std::set<std::string> listed;  // folded
    for (const InstallCopy* copy = list.first(); copy != nullptr; copy = list.next()) {
        listed.insert(foldUpper(copy->name()));
    }
    for (const Subkey& copy : subkeys) {
        if (!listed.contains(foldUpper(copy.name))) {
            return "copy " + copy.name + " cannot be read";
        }
    }
    return {};
}

Status Ensurer::make(const std::vector<WantedCopy>& wanted) {
    Status status = kSuccess;
    for (auto copy = wanted.begin(); status == kSuccess && copy != wanted.end(); ++copy) {
        status = copy->isPresent ? makePresent(*copy) : kSuccess;
    }
    for (auto name = removals_.begin(); status == kSuccess && name != removals_.end(); ++name) {
        status = makeAbsent(*name);
    }
    return status;
}

std::size_t Ensurer::findRemovals(InstallCopyList& list, const std::vector<WantedCopy>& wanted) {
    std::set<std::string> present;  // folded
    std::set<std::string> absent;
    for (const WantedCopy& copy : wanted) {
        (copy.isPresent ? present : absent).insert(foldUpper(copy.name));
    }
    for (const InstallCopy* copy = list.first(); copy != nullptr; copy = list.next()) {
        const std::string fold = foldUpper(copy->name());
        const bool isPruned = choices_.prune && copy != list.version8Copy() && !present.contains(fold);
        if (isPruned || absent.contains(fold)) {
            removals_.emplace_back(copy->name());
        } else {
            present.insert(fold);
        }
    }
    return present.size();
}

Status Ensurer::makePresent(const WantedCopy& copy) {
    bool isInOrder = true;
    for (const std::string_view root : {layout::kCopy, layout::kCopy32}) {
        const Status status = compare(substituteCopyName(root, copy.name), copy.location, isInOrder);
        if (status != kSuccess) {
            return status;
        }
    }
    const std::string service(managementServiceName(copy.name).view());
    Status status = isInOrder ? hasService(service, isInOrder) : kSuccess;
    if (status == kSuccess && isInOrder) {
        noteVersion(copy.name);
    } else if (status == kSuccess) {
        status = runTool({"-addKZ7Copy", copy.name.c_str(), copy.location.c_str()});
    }
    return status == kSuccess ? checkService(service, copy.location) : status;
}

Status Ensurer::compare(const std::string& root, const std::string& location, bool& isInOrder) {
    OwnedKey key(*ports_.registry);
    std::string open;
    Status status = kSuccess;
    for (const LayoutRow& row : copyRows()) {
        const std::string path = row.key.empty() ? root : root + '\\' + std::string(row.key);
        if (path != open) {
            open = path;
            status = ports_.registry->openKey(KeyHandle::localMachine, path, kKeyQueryValue, key.receive());
        }
        std::optional<ValueState> state;
        status = status == kSuccess ? reader_.value(key.get(), row.name, state) : status;
        if (status != kSuccess) {
            isInOrder = false;
            return isNotFound(status) ? kSuccess : status;
        }
        const bool isWanted = row.data != kLocation || state == ValueState{ValueType::sz, location + '\0'};
        isInOrder = isInOrder && state && isWanted;
    }
    return kSuccess;
}

Status Ensurer::hasService(const std::string& name, bool& exists) {
    OwnedService manager(*ports_.services);
    OwnedService service(*ports_.services);
    Status status = ports_.services->openManager(kServiceManagerConnect, manager.receive());
    if (status == kSuccess) {
        status = ports_.services->openService(manager.get(), name, kServiceQueryStatus, service.receive());
    }
    exists = status == kSuccess;
    return status == kServiceDoesNotExist ? kSuccess : status;
}

// The deletions do not report their failures.
Status Ensurer::makeAbsent(const std::string& name) {
    // Not by the flow, which reads the list of all copies for each of them.
    deleteCopy(*ports_.registry, *ports_.services, name, left_ == 0 && name == removals_.back());
    OwnedKey key(*ports_.registry);
    bool hasRest = false;
    Status status = hasService(std::string(managementServiceName(name).view()), hasRest);
    if (status == kSuccess && !hasRest) {
        status = ports_.registry->openKey(KeyHandle::localMachine, substituteCopyName(layout::kCopy, name),
                                          kKeyQueryValue, key.receive());
        hasRest = status == kSuccess;
        status = isNotFound(status) ? kSuccess : status;
    }
    status = status == kSuccess && hasRest ? kFailed : status;
    if (status != kSuccess) {
        errors.push_back({0, status, compose("copy %s was not removed whole: error %u", {name, status})});
    }
    return status;
}

// A service elsewhere is as the add leaves it, unless it is to be corrected.
Status Ensurer::checkService(const std::string& name, const std::string& location) {
    ValueState program;
    const Status status = readServiceProgram(*ports_.registry, name, program);
    if (status != kSuccess || isProgramOf(location, program.text())) {
        return isNotFound(status) ? kSuccess : status;
    }
    if (!choices_.services) {
        notes.push_back("service " + shownText(name) + " stays at " + shownText(program.text()) +
                        " (--services corrects it)");
        return kSuccess;
    }
    const std::string record = std::string(kServiceKeys) + name;
    const ChangeSet change = {
        {Change::Kind::value,
         fullKeyName({KeyHandle::localMachine, record}),
         {},
         "ImagePath",
         program,
         ValueState{ValueType::expandSz, std::string(managementServiceProgram(location).view()) + '\0'}}};
    std::string failed;
    return applyChangeSet(*ports_.registry, servicesAreRows_ ? nullptr : ports_.services, change, failed);
}

void Ensurer::noteVersion(const std::string& name) {
    const std::string path = substituteCopyName(layout::kCopy, name) + "\\CurrentVersion";
    OwnedKey key(*ports_.registry);
    if (ports_.registry->openKey(KeyHandle::localMachine, path, kKeyQueryValue, key.receive()) != kSuccess) {
        return;
    }
    for (const LayoutRow& row : copyRows()) {
        std::optional<ValueState> state;
        if (row.key == "CurrentVersion" && reader_.value(key.get(), row.name, state) == kSuccess && state &&
            state->text() != row.data) {
            notes.push_back(compose("copy %s: %s stays %s", {shownText(name), row.name, shownText(state->text())}));
        }
    }
}

Status Ensurer::runTool(std::vector<const char*> words) {
    words.insert(words.begin(), "kz7InstallReg");
    const Status status = kz7::runTool(ports_, words, &errors);
    return status == kSuccess && hasFailure(errors) ? kFailed : status;
}

}  // namespace kz7
