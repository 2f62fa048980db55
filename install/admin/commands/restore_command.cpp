#include <algorithm>
#include <iterator>

#include "install/admin/change_report.h"
#include "install/admin/commands/commands.h"
#include "install/admin/registry_source.h"

namespace kz7 {
namespace {

struct RestoreOptions : ChangeOptions {
    std::string file;
};

Answer nothingToRestore(Admin& admin, const RestoreOptions& options) {
    return admin.fault("nothing to restore: " + shownText(options.file));
}

// What turns the product's keys and services into those of the file.
Answer findChanges(Admin& admin, const RestoreOptions& options, RegistrySource& file, ChangeSet& changes) {
    const bool isOwn = admin.platform().storeIsOwn();
    Snapshot wanted;
    if (const Answer read = file.readProduct(isOwn, wanted); read != kAnswerYes) {
        return read;
    }
    if (wanted.empty()) {
        return nothingToRestore(admin, options);
    }
    RegistrySource machine(admin, ".");
    Snapshot live;
    if (const Answer opened = machine.open(); opened != kAnswerYes) {
        return opened;
    }
    const Answer read = machine.readProduct(isOwn, live);
    changes = difference(live, wanted);
    return read;
}

// A host that folds the case of more letters than we do has one key where the difference sees two.
Answer findTwins(Admin& admin, const ChangeSet& changes) {
    ChangeSet created;
    std::copy_if(changes.begin(), changes.end(), std::back_inserter(created),
                 [](const Change& change) { return change.kind == Change::Kind::keyCreated; });
    std::vector<const Change*> twins;
    std::string key;
    const Status status = findConflicts(admin.registry(), admin.platform().storeIsOwn(), created, twins, key);
    if (status != kSuccess) {
        return admin.storeFault("cannot read: " + shownText(key), status);
    }
    return twins.empty() ? kAnswerYes
                         : admin.fault("cannot restore: " + shownText(twins.front()->key) +
                                       " exists under another spelling of its name");
}

// The product's keys and services, and no others, in one transaction.
Answer restoreKeys(Admin& admin, const RestoreOptions& options, RegistrySource& file) {
    ChangeSet changes;
    Answer answer = findChanges(admin, options, file, changes);
    answer = answer == kAnswerYes ? findTwins(admin, changes) : answer;
    if (answer != kAnswerYes) {
        return answer;
    }
    ChangeRun run;
    if (options.check) {
        Preview preview(admin.platform(), false);
        answer = fillPreview(admin, preview);
        answer = answer == kAnswerYes ? makeChanges(admin, preview.ports(), changes) : answer;
        run.set(preview.changes());
        return answer == kAnswerYes ? showRun(admin, options, run) : answer;
    }
    admin.beginRun();
    RecordedPorts recorded(admin.platform().ports(),
                           {.wholeServices = admin.platform().storeIsOwn(), .holdsCommits = true});
    answer = makeChanges(admin, recorded.ports(), changes);
    answer = answer == kAnswerYes ? commitRun(admin, options, recorded, shownText(options.file), run) : answer;
    return answer == kAnswerYes ? showRun(admin, options, run) : answer;
}

// A new store with everything that the file holds, in the place of one that is missing or damaged.
Answer restoreStore(Admin& admin, const RestoreOptions& options, RegistrySource& file) {
    MemoryRegistry empty;
    std::vector<KeyStart> roots;
    Snapshot before;
    Snapshot wanted;
    std::string key;
    findEverything(empty, true, roots);
    readSnapshot(empty, true, roots, before, key);
    if (const Answer read = file.read({}, true, wanted); read != kAnswerYes) {
        return read;
    }
    ChangeRun run;
    run.set(difference(before, wanted));
    if (run.changes.empty()) {
        return nothingToRestore(admin, options);
    }
    if (!options.check) {
        std::string kept;
        const auto fill = [&](IRegistryStore& store) { return applyChangeSet(store, nullptr, run.changes, key); };
        const Status status = admin.platform().replaceStore(fill, kept);
        if (!kept.empty()) {
            run.notes.push_back("the store before is kept as " + shownText(kept));
        }
        if (status != kSuccess) {
            if (!kept.empty()) {
                admin.tell(run.notes.back());
            }
            return admin.storeFault("cannot replace store: " + shownText(admin.platform().storeName()), status);
        }
    }
    return showRun(admin, options, run);
}

Answer restore(Admin& admin, const RestoreOptions& options) {
    if (!admin.open(options.check, true)) {
        return kAnswerFault;
    }
    IPlatform& platform = admin.platform();
    RegistrySource file(admin, options.file);
    Answer answer = file.open();
    answer = answer == kAnswerYes ? file.examine() : answer;
    if (answer != kAnswerYes) {
        return answer;
    }
    std::vector<std::string> damages;
    if (!platform.storeIsLost() && platform.examineStore(damages) == kSuccess && !damages.empty()) {
        admin.tell(compose("%s: %s", {shownText(platform.storeName()), shownText(damages.front())}));
        return restoreStore(admin, options, file);
    }
    answer = platform.storeIsLost() ? kAnswerFault : restoreKeys(admin, options, file);
    // Damage is found when the store is examined, read or changed.
    return answer == kAnswerFault && platform.storeIsLost() ? restoreStore(admin, options, file) : answer;
}

}  // namespace

void addRestoreCommand(Command& program, Admin& admin) {
    auto command = program.add("restore", "Bring the product's keys and services back to a backup");
    auto& options = command.answerWith(admin, restore);
    addChangeOptions(command, admin, options);
    command.text("FILE", options.file, "A backup, or an export as registry-editor text").isRequired();
}

}  // namespace kz7
