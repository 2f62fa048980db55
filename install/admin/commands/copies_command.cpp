#include <CLI/CLI.hpp>
#include <array>
#include <map>
#include <optional>

#include "install/admin/commands/commands.h"
#include "install/admin/copy_location.h"
#include "install/admin/formats/json_text.h"
#include "install/admin/formats/text_table.h"
#include "install/platform/text.h"
#include "install/src/copies/copy_records.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/services/management_service.h"

namespace kz7 {
namespace {

struct View {
    const char* name;
    std::string_view copies;
};
constexpr std::array kViews = {View{"native", layout::kCopies}, View{"32-bit", layout::kCopies32}};

struct CopyInView {
    std::string location;
    InstallCopyInfo info;
};

struct CopyRow {
    std::string name;
    std::array<std::optional<CopyInView>, kViews.size()> views;
    std::string service;
    std::string state;  // of the service, in words; empty: there is no such service
};

using CopyRows = std::map<std::string, CopyRow>;  // by upper-cased name

// A view without its key has no copies.
Status readView(Admin& admin, std::size_t view, CopyRows& rows) {
    IRegistryStore& registry = admin.registry();
    const std::string_view copies = kViews[view].copies;
    RegistryValues values(registry, admin.platform().debugOutput(), kKeyRead);
    OwnedKey key(registry);
    Status status = registry.openKey(KeyHandle::localMachine, copies, kKeyRead, key.receive());
    TextBuffer<kMaxKeyName + 1> name;
    for (std::uint32_t index = 0;
         succeeded(status) && succeeded(status = registry.enumerateKey(key.get(), index, name, nullptr)); ++index) {
        CopyRow& row = rows[foldUpper(name.text())];
        row.name = row.name.empty() ? std::string(name.text()) : row.name;
        row.views[view] = {locationOf(registry, compose("%s\\%s", {copies, name.text()})),
                           InstallCopyInfo(values, name.text(), copies)};
    }
    return isNotFound(status) || isEndOfItems(status) ? kSuccess : status;
}

std::string stateText(ServiceState state) {
    switch (state) {
        case ServiceState::stopped:
            return "stopped";
        case ServiceState::startPending:
            return "starting";
        case ServiceState::stopPending:
            return "stopping";
        case ServiceState::running:
            return "running";
    }
    return "state " + std::to_string(static_cast<std::uint32_t>(state));
}

std::string stateOf(IServiceManager& services, ServiceHandle manager, const std::string& name) {
    OwnedService service(services);
    ServiceState state{};
    Status status = services.openService(manager, name, kServiceQueryStatus, service.receive());
    if (succeeded(status)) {
        status = services.queryState(service.get(), state);
    }
    if (status == kServiceDoesNotExist || status == kInvalidName) {
        return {};
    }
    return succeeded(status) ? stateText(state) : compose("unknown, error %u", {status});
}

Answer readCopies(Admin& admin, CopyRows& rows) {
    for (std::size_t view = 0; view < kViews.size(); ++view) {
        if (const Status status = readView(admin, view, rows); !succeeded(status)) {
            return admin.storeFault("cannot read copies", status);
        }
    }
    IServiceManager& services = admin.platform().services();
    OwnedService manager(services);
    const Status opened = services.openManager(kServiceManagerConnect, manager.receive());
    for (auto& [fold, row] : rows) {
        row.service = managementServiceName(row.name).view();
        row.state =
            succeeded(opened) ? stateOf(services, manager.get(), row.service) : compose("unknown, error %u", {opened});
    }
    return admin.platform().storeFaultTold() ? kAnswerFault : kAnswerYes;
}

TableRow tableRow(const CopyRow& row, std::size_t view) {
    const CopyInView& copy = *row.views[view];
    return {shownText(row.name),
            kViews[view].name,
            shownText(copy.info.getVersion()),
            copy.info.isValid() ? "yes" : "no",
            copy.location.empty() ? "none" : shownText(copy.location),
            row.state.empty() ? "none" : shownText(row.service) + " " + row.state};
}

std::string copiesText(const CopyRows& copies, std::uint32_t columns) {
    std::vector<TableRow> table = {{"NAME", "VIEW", "VERSION", "VALID", "LOCATION", "SERVICE"}};
    for (const auto& [fold, row] : copies) {
        for (std::size_t view = 0; view < kViews.size(); ++view) {
            if (row.views[view]) {
                table.push_back(tableRow(row, view));
            }
        }
    }
    return tableText(table, columns);
}

void appendMember(const char* name, std::string_view text, std::string& json) {
    json += ",\"";
    json += name;
    json += "\":";
    appendJsonText(text, json);
}

std::string copiesJson(const CopyRows& copies, const std::string& store) {
    std::string json = "{\"store\":";
    appendJsonText(store, json);
    json += ",\"copies\":[";
    std::string_view separator = "\n";
    for (const auto& [fold, row] : copies) {
        for (std::size_t view = 0; view < kViews.size(); ++view) {
            const auto& copy = row.views[view];
            if (!copy) {
                continue;
            }
            json += separator;
            json += "{\"name\":";
            appendJsonText(row.name, json);
            appendMember("view", kViews[view].name, json);
            appendMember("version", copy->info.getVersion(), json);
            json += copy->info.isValid() ? ",\"valid\":true" : ",\"valid\":false";
            appendMember("location", copy->location, json);
            appendMember("service", row.state.empty() ? "" : row.service, json);
            appendMember("state", row.state, json);
            json += '}';
            separator = ",\n";
        }
    }
    return json + "]}\n";
}

Answer showCopies(Admin& admin, bool json) {
    CopyRows copies;
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    if (const Answer read = readCopies(admin, copies); read != kAnswerYes) {
        return read;
    }
    const std::string store = admin.platform().storeName();
    const Answer shown = admin.show(json             ? copiesJson(copies, store)
                                    : copies.empty() ? std::string{}
                                                     : copiesText(copies, admin.output().columns),
                                    json ? Admin::Form::document : Admin::Form::text);
    return shown != kAnswerYes || !copies.empty() ? shown : admin.no("no installed copy: " + shownText(store));
}

}  // namespace

void addCopiesCommand(CLI::App& program, Admin& admin) {
    auto* command = program.add_subcommand("copies", "Show the installed copies and their services");
    auto json = std::make_shared<bool>(false);
    command->add_flag("--json", *json, "Write JSON for programs");
    command->callback([&admin, json] { admin.answer = [&admin, json] { return showCopies(admin, *json); }; });
}

}  // namespace kz7
