#include "install/admin/repair.h"

#include <algorithm>

#include "install/platform/memory/registry.h"
#include "install/platform/memory/small_ports.h"
#include "install/platform/service_records.h"
#include "install/platform/text.h"
#include "install/src/add_copy.h"
#include "install/src/registry/change_set.h"
#include "install/src/registry/copy_name.h"
#include "install/src/registry/registry_access.h"
#include "install/src/services/management_service.h"
#include "install/src/services/provider_registration.h"
#include "install/src/version9.h"

namespace kz7 {
namespace {

constexpr int kRounds = 3;
constexpr std::string_view kServiceProgram = "\\bin\\kz7mgmtsvc.exe";

class Repairer {
public:
    Repairer(const Ports& ports, bool servicesAreRows, const RepairRequest& request, std::string& key)
        : ports_(ports), registry_(*ports.registry), servicesAreRows_(servicesAreRows), request_(request), key_(key) {}

    // Later groups depend on earlier ones: services on locations, aliases on versions.
    Status run(std::vector<Finding>& rest) {
        Status status = read();
        for (const auto& [group, step] : {std::pair(std::string_view("migration"), &Repairer::repairMigration),
                                          {"copies", &Repairer::repairCopies},
                                          {"services", &Repairer::repairServices},
                                          {"properties", &Repairer::repairProperties},
                                          {"aliases", &Repairer::repairAliases}}) {
            // What is repaired may uncover more: the views of a half copy differ once it is whole.
            for (int round = 0; round < kRounds && status == kSuccess && isAsked(group); ++round) {
                status = (this->*step)();
                status = status == kSuccess ? read() : status;
            }
        }
        for (const Finding& finding : findings_) {
            if (request_.covers(finding) && finding.kind().mark == Mark::fault) {
                rest.push_back(finding);
            }
        }
        return status;
    }

private:
    bool isAsked(std::string_view group) const {
        return std::any_of(findings_.begin(), findings_.end(), [&](const Finding& finding) {
            return finding.kind().group == group && request_.covers(finding);
        });
    }

    Status read() {
        machine_ = {};
        const Status status = readMachine(registry_, Depth::whole, machine_, key_);
        findings_ = status == kSuccess ? findFindings(machine_, *ports_.files, false) : findings_;
        return status;
    }

    Status write(std::string_view path, std::string_view name, std::string_view data) {
        key_ = path;
        return setText(registry_, path, name, data);
    }

    Status repairCopies() {
        Status status = kSuccess;
        for (auto finding = findings_.begin(); status == kSuccess && finding != findings_.end(); ++finding) {
            const CopyRow* const copy = machine_.find(finding->copy);
            if (copy != nullptr && finding->kind().group == "copies" && request_.covers(*finding)) {
                status = repairCopy(*finding, *copy);
            }
        }
        return status;
    }

    Status repairCopy(const Finding& finding, const CopyRow& copy) {
        const std::string location = locationOf(copy);
        if (location.empty() && finding.reason == Reason::halfCopy) {
            return removeDebris(copy);
        }
        const std::size_t view = isDifference(finding) ? kOther : finding.view;
        const std::string root = std::string(kViews[view].copies) + '\\' + copy.name();
        Status status = kSuccess;
        for (std::size_t row = 0; status == kSuccess && row < copyRows().size(); ++row) {
            const LayoutRow& layout = copyRows()[row];
            std::string data;
            if (wants(finding, copy, view, row, location, data)) {
                const std::string path = layout.key.empty() ? root : root + '\\' + std::string(layout.key);
                status = write(path, layout.name, data);
            }
        }
        if (status == kSuccess && finding.reason == Reason::versionsDiffer && copy.views[kNative]->fixLevel) {
            status = write(root + "\\CurrentVersion", "Fix Level", *copy.views[kNative]->fixLevel);
        }
        return status;
    }

    static bool isDifference(const Finding& finding) {
        return finding.reason == Reason::locationsDiffer || finding.reason == Reason::versionsDiffer;
    }

    // Whether a row of a view is to be written, and with what: the other view's text before that of a new copy.
    static bool wants(const Finding& finding, const CopyRow& copy, std::size_t view, std::size_t row,
                      const std::string& location, std::string& data) {
        const LayoutRow& layout = copyRows()[row];
        const auto textIn = [&](std::size_t from) {
            return copy.views[from] ? copy.views[from]->rows[row] : std::nullopt;
        };
        const std::optional<std::string> text = textIn(view);
        const std::optional<std::string> other = textIn(view == kNative ? kOther : kNative);
        const bool isLocation = layout.data == kLocation;
        data = isLocation ? location : other && !other->empty() ? *other : layout.data;
        switch (finding.reason) {
            case Reason::halfCopy:
                return !text;
            case Reason::noLocation:
                return layout.key.empty() && !location.empty();
            case Reason::invalidVersion:
                return layout.key == "CurrentVersion" && (!text || text->empty());
            case Reason::locationsDiffer:
                data = other.value_or(data);
                return isLocation && text != other;
            case Reason::versionsDiffer:
                data = other.value_or(data);
                return layout.key == "CurrentVersion" && text != other;
            default:
                return false;
        }
    }

    // Where a copy is, by the first record that tells: its key or its global profile in either view, or its service.
    std::string locationOf(const CopyRow& copy) const {
        std::string location;
        for (std::size_t row = 0; row < copyRows().size(); ++row) {
            for (std::size_t view = 0; copyRows()[row].data == kLocation && view < kViews.size(); ++view) {
                const auto& found = copy.views[view];
                location = location.empty() && found ? found->rows[row].value_or(location) : location;
            }
        }
        if (!location.empty()) {
            return location;
        }
        if (copy.service != std::string::npos) {
            const std::string& program = machine_.services[copy.service].program;
            if (program.size() > kServiceProgram.size() && program.ends_with(kServiceProgram)) {
                return program.substr(0, program.size() - kServiceProgram.size());
            }
        }
        return {};
    }

    // What an add left behind that failed at its first rows. A key with anything of its own stays.
    Status removeDebris(const CopyRow& copy) {
        Status status = kSuccess;
        for (std::size_t view = 0; status == kSuccess && view < kViews.size(); ++view) {
            const KeyName name{KeyHandle::localMachine, std::string(kViews[view].copies) + '\\' + copy.name()};
            KeyStart start;
            Snapshot tree;
            if (!copy.views[view] || findKey(registry_, name, start) != kSuccess) {
                continue;
            }
            key_ = name.path;
            status = readSnapshot(registry_, true, {start}, tree, key_);
            if (status == kSuccess && std::all_of(tree.begin(), tree.end(), isLayout)) {
                status = deleteTree(registry_, name.root, name.path, 0, {}, {});
            }
        }
        return status;
    }

    // Whether a key of a copy has nothing but rows of the layout.
    static bool isLayout(const KeyRecord& record) {
        const std::string key = record.depth == 0 ? "" : record.name.substr(record.name.find_last_of('\\') + 1);
        const auto isRow = [&](const KeyValue& value) {
            return std::any_of(copyRows().begin(), copyRows().end(), [&](const LayoutRow& row) {
                return equalsIgnoreCase(row.key, key) && equalsIgnoreCase(row.name, value.name);
            });
        };
        const bool isKey = std::any_of(copyRows().begin(), copyRows().end(),
                                       [&](const LayoutRow& row) { return equalsIgnoreCase(row.key, key); });
        return record.depth <= 1 && isKey && std::all_of(record.values.begin(), record.values.end(), isRow);
    }

    // Through the port; what the port cannot change goes to `changes`.
    Status repairService(const Finding& finding, Report& report, ChangeSet& changes) {
        if (finding.reason == Reason::serviceWithoutCopy) {
            return deleteServiceByName(*ports_.services, finding.subject);
        }
        const CopyRow* const copy = machine_.find(finding.copy);
        const std::string location = copy == nullptr ? std::string{} : copy->shown().location;
        if (finding.reason != Reason::copyWithoutService) {
            addServiceChange(finding, *copy, changes);
        } else if (!location.empty()) {
            const Status status =
                registerManagementService(registry_, *ports_.services, report, location, finding.copy, false);
            // No service can have the name of some copies; the finding remains.
            return status == kInvalidName ? kSuccess : status;
        }
        return kSuccess;
    }

    Status repairServices() {
        Status status = kSuccess;
        ChangeSet changes;
        SilentConsole lines;
        Report report(lines);
        for (auto finding = findings_.begin(); status == kSuccess && finding != findings_.end(); ++finding) {
            if (finding->kind().group != "services" || !request_.covers(*finding)) {
                continue;
            }
            key_ = finding->subject;
            status = repairService(*finding, report, changes);
        }
        return status == kSuccess
                   ? applyChangeSet(registry_, servicesAreRows_ ? nullptr : ports_.services, changes, key_)
                   : status;
    }

    // The later change of one value holds: a service that is elsewhere and shadowed gets its own path, quoted.
    void addServiceChange(const Finding& finding, const CopyRow& copy, ChangeSet& changes) const {
        const std::string key = fullKeyName({KeyHandle::localMachine, std::string(kServiceKeys) + finding.subject});
        const std::string program(managementServiceProgram(copy.shown().location).view());
        Change change{Change::Kind::value, key, {}, "ImagePath", {}, {}};
        if (finding.reason == Reason::serviceDisabled) {
            change.name = "Start";
            change.after = ValueState{ValueType::dword, std::string("\2\0\0\0", 4)};
        } else {
            const bool isQuoted = finding.reason == Reason::serviceShadowed;
            change.after = ValueState{ValueType::expandSz, (isQuoted ? '"' + program + '"' : program) + '\0'};
        }
        changes.push_back(std::move(change));
    }

    Status repairProperties() {
        Status status = kSuccess;
        for (auto key = machine_.savedProperties.begin(); status == kSuccess && key != machine_.savedProperties.end();
             ++key) {
            key_ = "HKEY_USERS\\" + *key;
            status = deleteTree(registry_, KeyHandle::users, *key, 0, {}, {});
        }
        return status;
    }

    // The rewrite that ends a provider registration, then what its walk does not reach.
    Status repairAliases() {
        Status status = kSuccess;
        if (machine_.hasView[kNative]) {
            OwnedKey other(registry_);
            key_ = layout::kCopies32;
            status =
                registry_.createKey(KeyHandle::localMachine, layout::kCopies32, {}, kKeyQueryValue, other.receive());
            other.reset();
            MemoryDebugOutput unheard;
            status = status == kSuccess ? rewriteInstallCopiesProfile(registry_, unheard) : status;
            status = status == kSuccess ? read() : status;
        }
        for (auto finding = findings_.begin(); status == kSuccess && finding != findings_.end(); ++finding) {
            if (finding->kind().group == "aliases") {
                status = repairAlias(*finding);
            }
        }
        return status;
    }

    Status repairAlias(const Finding& finding) {
        const auto row = machine_.aliases.find(foldUpper(finding.subject));
        const std::string_view path = kViews[finding.view].copies;
        OwnedKey key(registry_);
        key_ = path;
        Status status = registry_.openKey(KeyHandle::localMachine, path, kKeySetValue, key.receive());
        if (status != kSuccess || row == machine_.aliases.end()) {
            return status;
        }
        const std::optional<std::string>& should = row->second.should;
        const bool stays = should && finding.reason != Reason::aliasNameTooLong;
        return stays ? registry_.setValue(key.get(), row->second.prefix, ValueType::sz, *should)
                     : registry_.deleteValue(key.get(), row->second.prefix);
    }

    // Back: as before the migration. On: back, and the whole migration once more, without its programs.
    Status repairMigration() {
        if (request_.location.empty() && !request_.isBack) {
            return kSuccess;
        }
        key_ = layout::kBackup;
        if (!succeeded(TreeCopy(registry_).copy(KeyHandle::localMachine, layout::kBackup, KeyHandle::localMachine,
                                                layout::kProduct, true))) {
            return kFailed;
        }
        Status status = deleteTree(registry_, KeyHandle::localMachine, layout::kBackup, 0, {}, {});
        if (status != kSuccess || request_.isBack) {
            return status;
        }
        SilentConsole lines;
        Report report(lines);
        MemoryRegistry noServices;
        ServiceRecords unregistered(noServices, *ports_.files);
        const bool withServices = request_.groups.contains("services");
        const auto level = [&](std::string_view location) {
            std::string text;
            queryLevel(*ports_.libraries, report, location, text);
            return text;
        };
        MemoryDebugOutput unheard;
        key_ = layout::kProduct;
        return migrateToVersion9(
            registry_, withServices ? *ports_.services : static_cast<IServiceManager&>(unregistered), report, level,
            [&](std::string_view) { return rewriteInstallCopiesProfile(registry_, unheard); }, request_.location);
    }

    const Ports& ports_;
    IRegistryStore& registry_;
    bool servicesAreRows_;
    const RepairRequest& request_;
    std::string& key_;
    MachineState machine_;
    std::vector<Finding> findings_;
};

}  // namespace

bool RepairRequest::covers(const FindingKind& kind) const {
    if (groups.empty() && kinds.empty()) {
        return !kind.group.empty() && kind.group != "services" && kind.group != "migration";
    }
    return kinds.contains(kind.name) || groups.contains(kind.group);
}

bool RepairRequest::covers(const Finding& finding) const {
    // Aliases belong to no single copy.
    return covers(finding.kind()) && (copy.empty() || finding.copy.empty() || equalsIgnoreCase(finding.copy, copy));
}

Status repairMachine(const Ports& ports, bool servicesAreRows, const RepairRequest& request, std::vector<Finding>& rest,
                     std::string& key) {
    return Repairer(ports, servicesAreRows, request, key).run(rest);
}

}  // namespace kz7
