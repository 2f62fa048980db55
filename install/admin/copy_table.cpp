#include "install/admin/copy_table.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
namespace {

// Whether a version text is the prefix or goes on from it behind a dot.
bool continues(std::string_view version, std::string_view prefix) {
    return equalsIgnoreCase(version, prefix) || (version.size() > prefix.size() && version[prefix.size()] == '.' &&
                                                 equalsIgnoreCase(version.substr(0, prefix.size()), prefix));
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
    return succeeded(status) ? stateText(state) : compose("unknown, error %u", {status});
}

bool isSame(const CopyInView& left, const CopyInView& right) {
    return left.location == right.location && left.info.getVersion() == right.info.getVersion();
}

std::string viewsOf(const CopyRow& copy) {
    if (copy.isRemoved()) {
        return "removed";
    }
    if (!copy.views[kOther]) {
        return "native only";
    }
    return isSame(*copy.views[kNative], *copy.views[kOther]) ? "both" : "32-bit differs";
}

bool fits(const CopyLine& line, const CopyFilter& filter) {
    return (!filter.versions || filter.versions->has(line.shown->info.getVersion())) &&
           (filter.view.empty() || filter.view == line.view) && (!filter.valid || line.shown->info.isValid()) &&
           (!filter.isDefault || line.isDefault) &&
           (filter.name.empty() || equalsIgnoreCase(filter.name, line.shown->name));
}

void addLines(const MachineState& machine, const CopyRow& copy, const CopyFilter& filter, bool perView,
              std::vector<CopyLine>& lines) {
    CopyLine line{&copy, &copy.shown(), viewsOf(copy), {}, {}, machine.isDefault(copy)};
    if (!perView && fits(line, filter)) {
        lines.push_back(line);
    }
    for (std::size_t view = 0; perView && view < kViews.size(); ++view) {
        if (copy.views[view]) {
            line.shown = &*copy.views[view];
            line.view = kViews[view].name;
        }
        if (copy.views[view] && fits(line, filter)) {
            lines.push_back(line);
        }
    }
}

TableRow tableRow(const CopyLine& line) {
    return {shownText(line.shown->name) + (line.isDefault ? " *" : ""),
            line.view,
            shownText(line.shown->info.getVersion()),
            line.shown->info.isValid() ? "yes" : "no",
            line.shown->location.empty() ? "none" : shownText(line.shown->location),
            line.service.empty() ? "none" : shownText(line.service) + " " + line.state};
}

}  // namespace

bool VersionRange::parse(std::string_view text) {
    isPrefix_ = text.find_first_of("[]()") == std::string_view::npos;
    if (isPrefix_) {
        low_ = text;
        return !text.empty() && text.find(',') == std::string_view::npos;
    }
    const std::size_t comma = text.find(',');
    const bool isEnclosed =
        text.size() >= 3 && (text.front() == '[' || text.front() == '(') && (text.back() == ']' || text.back() == ')');
    if (!isEnclosed || comma == std::string_view::npos || text.find(',', comma + 1) != std::string_view::npos) {
        return false;
    }
    hasLow_ = text.front() == '[';
    hasHigh_ = text.back() == ']';
    low_ = text.substr(1, comma - 1);
    high_ = text.substr(comma + 1, text.size() - comma - 2);
    return low_.find_first_of("[]() ") == std::string::npos && high_.find_first_of("[]() ") == std::string::npos;
}

bool VersionRange::has(std::string_view version) const {
    if (isPrefix_) {
        return continues(version, low_);
    }
    const bool isAbove = low_.empty() || version > low_ || (hasLow_ && version == low_);
    const bool isBelow = high_.empty() || version < high_ || (hasHigh_ && version == high_);
    return isAbove && isBelow;
}

std::vector<CopyLine> copyLines(const MachineState& machine, IServiceManager& services, const CopyFilter& filter,
                                bool perView) {
    OwnedService manager(services);
    const Status opened = services.openManager(kServiceManagerConnect, manager.receive());
    std::vector<CopyLine> lines;
    for (const CopyRow& copy : machine.copies) {
        const std::size_t first = lines.size();
        addLines(machine, copy, filter, perView || !filter.view.empty(), lines);
        if (first == lines.size() || copy.service == std::string::npos) {
            continue;
        }
        const std::string& service = machine.services[copy.service].name;
        const std::string state =
            succeeded(opened) ? stateOf(services, manager.get(), service) : compose("unknown, error %u", {opened});
        for (std::size_t line = first; line < lines.size(); ++line) {
            lines[line].service = service;
            lines[line].state = state;
        }
    }
    return lines;
}

std::string copyField(const CopyLine& line, std::string_view name) {
    static constexpr auto yes = [](bool value) { return std::string(value ? "yes" : "no"); };
    // clang-format off
    static const std::array<std::string (*)(const CopyLine&), kCopyColumns.size()> kFields = {
        [](const CopyLine& one) { return one.shown->name; },
        [](const CopyLine& one) { return one.view; },
        [](const CopyLine& one) { return one.shown->info.getVersion(); },
        [](const CopyLine& one) { return yes(one.shown->info.isValid()); },
        [](const CopyLine& one) { return one.shown->location; },
        [](const CopyLine& one) { return one.service; },
        [](const CopyLine& one) { return one.state; },
        [](const CopyLine& one) { return yes(one.isDefault); },
    };
    // clang-format on
    const auto* const column = std::find(kCopyColumns.begin(), kCopyColumns.end(), name);
    return column == kCopyColumns.end() ? std::string{}
                                        : kFields[static_cast<std::size_t>(column - kCopyColumns.begin())](line);
}

std::string copiesText(const std::vector<CopyLine>& lines, const std::vector<std::string>& columns,
                       std::uint32_t width) {
    if (lines.empty()) {
        return {};
    }
    std::vector<TableRow> table;
    if (columns.empty()) {
        table.push_back({"NAME", "VIEW", "VERSION", "VALID", "LOCATION", "SERVICE"});
        for (const CopyLine& line : lines) {
            table.push_back(tableRow(line));
        }
        return tableText(table, width);
    }
    TableRow headings;
    for (const std::string& column : columns) {
        headings.push_back(foldUpper(column));
    }
    table.push_back(std::move(headings));
    for (const CopyLine& line : lines) {
        TableRow row;
        for (const std::string& column : columns) {
            const std::string text = shownText(copyField(line, column));
            row.push_back(text.empty() ? "none" : text);
        }
        table.push_back(std::move(row));
    }
    return tableText(table, width);
}

void appendCopy(const CopyLine& line, const std::vector<std::string>& columns, JsonWriter& json) {
    json.beginObject();
    for (const std::string_view column : kCopyColumns) {
        if (!columns.empty() && std::find(columns.begin(), columns.end(), column) == columns.end()) {
            continue;
        }
        if (column == "valid" || column == "default") {
            json.field(column, column == "valid" ? line.shown->info.isValid() : line.isDefault);
        } else {
            json.field(column, copyField(line, column));
        }
    }
    if (columns.empty()) {
        json.field("removed", line.copy->isRemoved());
    }
    json.end();
}

void appendCopies(const std::vector<CopyLine>& lines, const std::vector<std::string>& columns, JsonWriter& json) {
    json.beginArray();
    for (const CopyLine& line : lines) {
        appendCopy(line, columns, json);
    }
    json.end();
}

void appendAliases(const std::vector<const AliasRow*>& rows, JsonWriter& json) {
    json.beginArray();
    for (const AliasRow* const row : rows) {
        json.beginObject().field("prefix", row->prefix);
        for (std::size_t view = 0; view < kViews.size(); ++view) {
            if (row->values[view]) {
                json.field(view == kNative ? "native" : "other", row->values[view]->text);
            }
        }
        if (row->should) {
            json.field("should", *row->should).field("version", row->version);
        }
        json.end();
    }
    json.end();
}

std::vector<const AliasRow*> aliasRows(const MachineState& machine, std::string_view prefix) {
    std::vector<const AliasRow*> rows;
    for (const auto& [fold, row] : machine.aliases) {
        if ((row.should || isAliasName(row.prefix)) && (prefix.empty() || continues(row.prefix, prefix))) {
            rows.push_back(&row);
        }
    }
    return rows;
}

}  // namespace kz7
