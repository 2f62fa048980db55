#include "install/admin/formats/fleet_page.h"

#include <algorithm>

#include "install/admin/formats/html_page.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

using Rows = std::vector<std::vector<std::string>>;

// Bytes of the page, and of each table but the last, which gets what is left.
constexpr std::size_t kLargestPage = 4'900'000;
constexpr std::size_t kLargestTable = 700'000;
constexpr std::size_t kLongestName = 64;    // characters of the name of a machine, a copy or a version
constexpr std::size_t kLongestText = 600;   // characters of a longer text
constexpr std::size_t kNamedMachines = 20;  // in one cell
constexpr std::size_t kDifferences = 8;     // of one machine
constexpr std::size_t kColumns = 24;        // versions with a column of their own

std::string count(std::size_t number) {
    return std::to_string(number);
}

std::string name(std::string_view foreign) {
    return cutEscaped(foreign, kLongestName);
}

// As many rows as fit into the bytes; nothing without rows.
void appendRows(std::string_view caption, const std::vector<std::string_view>& headings, Rows rows, std::string& html,
                std::size_t bytes = kLargestTable) {
    if (rows.empty()) {
        return;
    }
    const std::size_t all = rows.size();
    std::size_t fitting = 0;
    for (std::size_t used = 0; fitting < all; ++fitting) {
        for (const std::string& cell : rows[fitting]) {
            used += cell.size() + std::string_view("<td></td>").size();
        }
        used += std::string_view("<tr><th scope=\"row\"></th></tr>\n").size();
        if (used > bytes) {
            break;
        }
    }
    rows.resize(fitting);
    html.append("<h3>").append(caption).append("</h3>\n");
    appendTable(caption, headings, rows, html);
    if (fitting < all) {
        html += "<p class=\"note\">" + count(all - fitting) + " more rows are left out.</p>\n";
    }
}

std::string machineNames(const Fleet& fleet, const std::vector<std::size_t>& machines) {
    std::string names;
    for (std::size_t place = 0; place < std::min(machines.size(), kNamedMachines); ++place) {
        names += (place == 0 ? "" : ", ") + name(fleet.machines[machines[place]].name);
    }
    return machines.size() <= kNamedMachines ? names
                                             : names + " and " + count(machines.size() - kNamedMachines) + " more";
}

void appendFindings(const Fleet& fleet, std::string& html) {
    beginSection("findings", "Findings", html);
    Rows unusable;
    bool isInOrder = true;
    for (const FleetMachine& machine : fleet.machines) {
        if (!machine.fault.empty()) {
            unusable.push_back({name(machine.name), escaped(machine.fault)});
        }
        isInOrder = isInOrder && machine.isInOrder && machine.fault.empty();
    }
    html += isInOrder ? "<p class=\"good\">All is in order.</p>\n" : "<p class=\"bad\">Not all is in order.</p>\n";
    appendRows("Machines without usable facts", {"Machine", "Why its facts cannot be used"}, std::move(unusable), html);
    Rows rows;
    for (const auto& [kind, same] : fleet.findings) {
        const std::string shown = name(kind);
        rows.push_back({same.mark == "fault" ? "<span class=\"bad\">" + shown + "</span>" : shown, name(same.mark),
                        count(same.count), count(same.machines.size()), machineNames(fleet, same.machines),
                        cutEscaped(same.example, kLongestText)});
    }
    appendRows("By kind", {"Kind", "Mark", "Findings", "Machines", "Which", "The first one"}, std::move(rows), html);
    html += "</section>\n";
}

std::string differenceLines(const FleetMachine& machine, const FleetValues& most) {
    const std::vector<std::string> differences =
        machine.fault.empty() ? differencesOf(machine, most) : std::vector<std::string>{};
    std::string lines;
    for (std::size_t place = 0; place < std::min(differences.size(), kDifferences); ++place) {
        lines += (place == 0 ? "" : "<br>") + cutEscaped(differences[place], kLongestText);
    }
    return differences.size() <= kDifferences ? lines
                                              : lines + "<br>and " + count(differences.size() - kDifferences) + " more";
}

void appendDifferences(const Fleet& fleet, std::string& html) {
    beginSection("differences", "Differences", html);
    const FleetValues most = fleet.mostFrequent();
    Rows common;
    Rows undecided;
    for (const auto& [fold, found] : most.all) {
        if (found.value || !found.isMajority) {
            (found.isMajority ? common : undecided)
                .push_back(
                    {name(found.label), cutEscaped(found.value.value_or("none"), kLongestText), count(found.machines)});
        }
    }
    Rows others;
    for (const FleetMachine& machine : fleet.machines) {
        if (std::string lines = differenceLines(machine, most); !lines.empty()) {
            others.push_back({name(machine.name), std::move(lines)});
        }
    }
    html += others.empty() ? "<p class=\"good\">No machine differs from the majority.</p>\n"
                           : "<p>" + count(others.size()) + " of " + count(fleet.machines.size()) +
                                 " machines differ from the majority.</p>\n";
    appendRows("Machines that differ from the majority", {"Machine", "Differs in"}, std::move(others), html);
    appendRows("What more than half of the machines have", {"What", "Value", "Machines"}, std::move(common), html);
    appendRows("What has no majority", {"What", "Most frequent", "Machines"}, std::move(undecided), html);
    html += "</section>\n";
}

// The versions that most machines have, in the order of the text.
std::map<std::string, std::size_t> columnsOf(const Fleet& fleet) {
    std::map<std::string, std::size_t> machines;
    for (const FleetMachine& machine : fleet.machines) {
        for (const auto& [version, copies] : machine.versions) {
            ++machines[version];
        }
    }
    std::vector<std::pair<std::size_t, std::string>> frequent;
    frequent.reserve(machines.size());
    for (const auto& [version, number] : machines) {
        frequent.emplace_back(number, version);
    }
    std::sort(frequent.rbegin(), frequent.rend());
    frequent.resize(std::min(frequent.size(), kColumns));
    std::map<std::string, std::size_t> columns;
    for (const auto& [number, version] : frequent) {
        columns.emplace(version, 0);
    }
    std::size_t column = 0;
    for (auto& [version, place] : columns) {
        place = ++column;
    }
    return columns;
}

void appendVersions(const Fleet& fleet, std::string& html) {
    beginSection("versions", "Versions", html);
    const std::map<std::string, std::size_t> columns = columnsOf(fleet);
    std::vector<std::string> titles;
    titles.reserve(columns.size());
    for (const auto& [version, column] : columns) {
        titles.push_back(name(version));
    }
    std::vector<std::string_view> headings = {"Machine"};
    headings.insert(headings.end(), titles.begin(), titles.end());
    headings.emplace_back("Others");
    bool hasOthers = false;
    Rows rows;
    for (const FleetMachine& machine : fleet.machines) {
        std::vector<std::string> row(headings.size());
        row.front() = name(machine.name);
        for (const auto& [version, copies] : machine.versions) {
            const auto column = columns.find(version);
            const bool isOther = column == columns.end();
            row[isOther ? row.size() - 1 : column->second] =
                cutEscaped(isOther ? compose("%s: %s", {version, copies}) : copies, kLongestText);
            hasOthers = hasOthers || isOther;
        }
        rows.push_back(std::move(row));
    }
    if (!hasOthers) {
        headings.pop_back();
        for (std::vector<std::string>& row : rows) {
            row.pop_back();
        }
    }
    const std::size_t left = kLargestPage - std::min(kLargestPage, html.size());
    appendRows("Copies of each version", headings, std::move(rows), html, left);
    html += "</section>\n";
}

}  // namespace

std::string fleetPage(const Fleet& fleet, const std::string& time) {
    std::size_t faulty = 0;
    std::size_t unusable = 0;
    for (const FleetMachine& machine : fleet.machines) {
        faulty += machine.isInOrder ? 0 : 1;
        unusable += machine.fault.empty() ? 0 : 1;
    }
    std::string html = pageStart("Machines and their copies",
                                 {"machines: " + count(fleet.machines.size()) + "; not in order: " + count(faulty) +
                                      "; without usable facts: " + count(unusable),
                                  time},
                                 {{"findings", "Findings"}, {"differences", "Differences"}, {"versions", "Versions"}});
    appendFindings(fleet, html);
    appendDifferences(fleet, html);
    appendVersions(fleet, html);
    return html + pageEnd();
}

}  // namespace kz7
