#include "install/admin/ensurer.h"

#include <algorithm>
#include <array>
#include <optional>
#include <set>

#include "install/admin/copy_location.h"
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
    OwnedKey copies(*ports_.registry);
    listed_ = ports_.registry->openKey(KeyHandle::localMachine, layout::kCopies, kKeyWalk, copies.receive());
    listed_ = listed_ == kSuccess ? reader_.subkeys(copies.get(), subkeys_) : listed_;
    if (std::string other = otherSpelling(copies.get(), wanted); !other.empty()) {
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
std::string Ensurer::otherSpelling(KeyHandle copies, const std::vector<WantedCopy>& wanted) {
    std::set<std::string> names;  // folded
    for (const Subkey& key : subkeys_) {
        names.insert(foldUpper(key.name));
    }
    for (const WantedCopy& copy : wanted) {
        OwnedKey key(*ports_.registry);
        if (listed_ == kSuccess && !names.contains(foldUpper(copy.name)) &&
            ports_.registry->openKey(copies, copy.name, kKeyQueryValue, key.receive()) == kSuccess) {
            return "copy " + shownText(copy.name) + " is installed under another spelling of its name";
        }
    }
    return {};
}

// Why the list is not known to be whole; empty if it is.
std::string Ensurer::unreadCopy(InstallCopyList& list) {
    if (isNotFound(listed_)) {
        return {};
    }
    if (listed_ != kSuccess || list.status() != 0) {
        return "the list of copies cannot be read whole";
    }
    std::set<std::string> listed;  // folded
    for (const InstallCopy* copy = list.first(); copy != nullptr; copy = list.next()) {
        listed.insert(foldUpper(copy->name()));
    }
    for (const Subkey& copy : subkeys_) {
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
    std::vector<std::string> kept;
    // The native view last: its versions are the copy's.
    for (const std::string_view root : {layout::kCopy32, layout::kCopy}) {
        kept.clear();
        const Status status = compare(substituteCopyName(root, copy.name), copy, isInOrder, kept);
        if (status != kSuccess) {
            return status;
        }
    }
    const std::string service(managementServiceName(copy.name).view());
    Status status = isInOrder ? hasService(service, isInOrder) : kSuccess;
    if (status == kSuccess && isInOrder) {
        notes.insert(notes.end(), kept.begin(), kept.end());
    } else if (status == kSuccess) {
        status = add(copy);
    }
    return status == kSuccess ? checkService(service, copy.location) : status;
}

namespace {

// A version that is not the one of an add is kept.
bool isAsWanted(const LayoutRow& row, const std::optional<ValueState>& state, const WantedCopy& copy,
                std::vector<std::string>& kept) {
    if (row.key == "CurrentVersion" && state && state->text() != row.data) {
        kept.push_back(compose("copy %s: %s stays %s", {shownText(copy.name), row.name, shownText(state->text())}));
    }
    return state && (row.data != kLocation || state == ValueState{ValueType::sz, copy.location + '\0'});
}

}  // namespace

Status Ensurer::compare(const std::string& root, const WantedCopy& copy, bool& isInOrder,
                        std::vector<std::string>& kept) {
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
        isInOrder = isInOrder && isAsWanted(row, state, copy, kept);
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

Status Ensurer::add(const WantedCopy& copy) {
    const std::array words = {"kz7InstallReg", "-addKZ7Copy", copy.name.c_str(), copy.location.c_str()};
    const Status status = runTool(ports_, words, &errors);
    return status == kSuccess && hasFailure(errors) ? kFailed : status;
}

}  // namespace kz7
