// Brings a machine in order again: what the check finds, kind by kind, through the ports of a run.
#pragma once

#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "install/admin/findings.h"
#include "install/platform/platform.h"
#include "install/src/registry/change_recorder.h"

namespace kz7 {

struct RepairRequest {
    std::set<std::string_view> groups;  // of the table of findings; empty: all but services and migration
    std::set<std::string_view> kinds;   // names of that table
    std::string copy;                   // empty: all copies
    std::string location;               // goes on with a half-done migration to this location
    bool isBack = false;                // takes a half-done migration back

    // Whether a finding of that kind is to be repaired.
    bool covers(const FindingKind& kind) const;
    bool covers(const Finding& finding) const;
};

// Repairs through ports whose commits do nothing, and starts no program. With `servicesAreRows` services are records of
// the registry. `rest` gets what was asked for and is not in order afterwards. On failure `key` names what failed.
Status repairMachine(const Ports& ports, bool servicesAreRows, const RepairRequest& request, std::vector<Finding>& rest,
                     std::string& key);

}  // namespace kz7
