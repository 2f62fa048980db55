// A machine as one page: no script, no network, readable in light and dark, on a phone, on paper and by screen readers.
#pragma once

#include <string>
#include <vector>

#include "install/admin/copy_table.h"
#include "install/admin/findings.h"

namespace kz7 {

struct ReportedRun {
    std::string title;
    std::string changes;  // a line each
};

struct ReportSource {
    std::string store;
    std::string host;
    std::string time;
    const MachineState& machine;
    std::vector<CopyLine> copies;
    std::vector<Finding> findings;  // also those that are in order
    std::vector<ReportedRun> runs;  // the last one first
};

std::string htmlReport(const ReportSource& source);

}  // namespace kz7
