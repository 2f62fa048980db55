#include <CLI/CLI.hpp>
#include <algorithm>
#include <optional>
#include <set>

#include "install/admin/change_report.h"
#include "install/admin/commands/commands.h"
#include "install/admin/copy_location.h"
#include "install/admin/input_file.h"
#include "install/admin/wanted_copies.h"
#include "install/platform/text.h"
#include "install/src/add_copy.h"
#include "install/src/copies/copy_list.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/copy_name.h"
#include "install/src/services/management_service.h"
#include "install/src/uselvlkz7reg.h"

namespace kz7 {
namespace {

struct EnsureOptions : ChangeOptions {
    std::string file;
    bool prune = false;
    bool all = false;
    bool services = false;
};

// Compares copies with what is wanted, and adds and removes them by the flows of the tool.
class Ensurer {
public:
    Ensurer(const Ports& ports, bool servicesAreRows, const EnsureOptions& options, ChangeRun& run)
        : ports_(ports), servicesAreRows_(servicesAreRows), options_(options), run_(run), reader_(*ports.registry) {}

    // Empty, or why nothing may be removed; checked before anything is changed.
    std::string plan(const std::vector<WantedCopy>& wanted) {
        InstallCopyList list(*ports_.registry, *ports_.debugOutput, false, false);
        const std::size_t left = findRemovals(list, wanted);
        if (!removals_.empty() && list.status() != 0) {
            return "cannot remove " + shownText(removals_.front()) + ": the list of copies cannot be read whole";
        }
        if (removals_.empty() || left != 0 || (options_.prune && options_.all)) {
            return {};
        }
        return "cannot remove " + shownText(removals_.back()) +
               ": the last copy takes the whole product along (--prune --all removes it)";
    }

    // Up to the first failure.
    Status make(const std::vector<WantedCopy>& wanted) {
        Status status = kSuccess;
        for (auto copy = wanted.begin(); status == kSuccess && copy != wanted.end(); ++copy) {
            status = copy->isPresent ? makePresent(*copy) : kSuccess;
        }
        for (auto name = removals_.begin(); status == kSuccess && name != removals_.end(); ++name) {
            status = runTool({"-removeKZ7Copy", name->c_str()});
        }
        return status;
    }

private:
    // Returns the number of copies that are left.
    std::size_t findRemovals(InstallCopyList& list, const std::vector<WantedCopy>& wanted) {
        std::set<std::string> present;  // folded
        std::set<std::string> absent;
        for (const WantedCopy& copy : wanted) {
            (copy.isPresent ? present : absent).insert(foldUpper(copy.name));
        }
        for (const InstallCopy* copy = list.first(); copy != nullptr; copy = list.next()) {
            const std::string fold = foldUpper(copy->name());
            const bool isPruned = options_.prune && copy != list.version8Copy() && !present.contains(fold);
            if (isPruned || absent.contains(fold)) {
                removals_.emplace_back(copy->name());
            } else {
                present.insert(fold);
            }
        }
        return present.size();
    }

    Status makePresent(const WantedCopy& copy) {
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

    // Both locations must be as wanted, of the other rows only the existence counts.
    Status compare(const std::string& root, const std::string& location, bool& isInOrder) {
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

    Status hasService(const std::string& name, bool& exists) {
        OwnedService manager(*ports_.services);
        OwnedService service(*ports_.services);
        Status status = ports_.services->openManager(kServiceManagerConnect, manager.receive());
        if (status == kSuccess) {
            status = ports_.services->openService(manager.get(), name, kServiceQueryStatus, service.receive());
        }
        exists = status == kSuccess;
        return status == kServiceDoesNotExist ? kSuccess : status;
    }

    // A service elsewhere is as the add leaves it, unless it is to be corrected.
    Status checkService(const std::string& name, const std::string& location) {
        const std::string wanted(managementServiceProgram(location).view());
        ValueState program;
        const Status status = readServiceProgram(*ports_.registry, name, program);
        if (status != kSuccess || program.text() == wanted) {
            return isNotFound(status) ? kSuccess : status;
        }
        if (!options_.services) {
            run_.notes.push_back("service " + shownText(name) + " stays at " + shownText(program.text()) +
                                 " (--services corrects it)");
            return kSuccess;
        }
        const std::string record = std::string(kServiceKeys) + name;
        const ChangeSet change = {{Change::Kind::value,
                                   fullKeyName({KeyHandle::localMachine, record}),
                                   {},
                                   "ImagePath",
                                   program,
                                   ValueState{ValueType::expandSz, wanted + '\0'}}};
        std::string failed;
        return applyChangeSet(*ports_.registry, servicesAreRows_ ? nullptr : ports_.services, change, failed);
    }

    void noteVersion(const std::string& name) {
        const std::string path = substituteCopyName(layout::kCopy, name) + "\\CurrentVersion";
        OwnedKey key(*ports_.registry);
        if (ports_.registry->openKey(KeyHandle::localMachine, path, kKeyQueryValue, key.receive()) != kSuccess) {
            return;
        }
        for (const LayoutRow& row : copyRows()) {
            std::optional<ValueState> state;
            if (row.key == "CurrentVersion" && reader_.value(key.get(), row.name, state) == kSuccess && state &&
                state->text() != row.data) {
                run_.notes.push_back(
                    compose("copy %s: %s stays %s", {shownText(name), row.name, shownText(state->text())}));
            }
        }
    }

    Status runTool(std::vector<const char*> words) {
        words.insert(words.begin(), "kz7InstallReg");
        const Status status = kz7::runTool(ports_, words, &run_.errors);
        return status == kSuccess && run_.isFailed() ? kFailed : status;
    }

    const Ports& ports_;
    bool servicesAreRows_;
    const EnsureOptions& options_;
    ChangeRun& run_;
    KeyReader reader_;
    std::vector<std::string> removals_;
};

// Runs on recorded ports whose commits do nothing.
Answer ensureOn(Admin& admin, const EnsureOptions& options, const std::vector<WantedCopy>& wanted, const Ports& ports,
                ChangeRun& run) {
    Ensurer ensurer(ports, admin.platform().storeIsOwn(), options, run);
    if (const std::string refusal = ensurer.plan(wanted); !refusal.empty()) {
        return admin.fault(refusal);
    }
    run.status = ensurer.make(wanted);
    ports.registry->commit();
    if (!options.json) {
        for (const ErrorLine& error : run.errors) {
            admin.tell(shownText(error.text.substr(0, error.text.find_last_not_of('\n') + 1)));
        }
    }
    return admin.platform().storeFaultTold() ? kAnswerFault : kAnswerYes;
}

Answer ensure(Admin& admin, const EnsureOptions& options) {
    if (!admin.open(options.check, true)) {
        return kAnswerFault;
    }
    InputFile file(admin, options.file);
    std::vector<WantedCopy> wanted;
    std::string fault;
    if (const Answer answer = file.read(); answer != kAnswerYes) {
        return answer;
    }
    if (!parseWantedCopies(file.bytes(), wanted, fault)) {
        return admin.fault(file.shown() + ": " + shownText(fault));
    }
    ChangeRun run;
    if (options.check) {
        Preview preview(admin.platform(), false);
        if (const Answer filled = fillPreview(admin, preview); filled != kAnswerYes) {
            return filled;
        }
        const Answer answer = ensureOn(admin, options, wanted, preview.ports(), run);
        run.changes = preview.changes();
        return answer == kAnswerYes ? showRun(admin, options, run) : answer;
    }
    MemoryConsole lines;
    Ports ports = admin.platform().ports();
    ports.console = &lines;
    const bool isOwn = admin.platform().storeIsOwn();
    RecordedPorts recorded(ports, isOwn, true);
    if (const Answer answer = ensureOn(admin, options, wanted, recorded.ports(), run); answer != kAnswerYes) {
        return answer;
    }
    if (!isOwn || run.status == kSuccess) {
        run.changes = recorded.changes();
        if (const Status status = admin.registry().commit(); status != kSuccess) {
            return admin.storeFault("cannot save changes: " + file.shown(), status);
        }
    }
    return showRun(admin, options, run);
}

}  // namespace

void addEnsureCommand(CLI::App& program, Admin& admin) {
    auto* command = program.add_subcommand("ensure", "Make the copies as a file lists them");
    auto options = std::make_shared<EnsureOptions>();
    addChangeOptions(*command, *options);
    command->add_option("--from", options->file, "A JSON file with the copies; \"-\" is standard input")->required();
    auto* prune = command->add_flag("--prune", options->prune, "Remove the copies that the file does not list");
    command->add_flag("--all", options->all, "Remove the last copy and the product too")->needs(prune);
    command->add_flag("--services", options->services, "Correct services that belong to another location");
    command->callback([&admin, options] { admin.answer = [&admin, options] { return ensure(admin, *options); }; });
}

}  // namespace kz7
