// What the commands that change a store have in common: their options, and how they tell what changed or would change.
#pragma once

#include <string>
#include <vector>

#include "install/admin/command_line.h"
#include "install/admin/preview.h"
#include "install/src/registry/change_set.h"
#include "install/src/registry/report.h"

namespace kz7 {

struct ChangeOptions {
    bool check = false;
    bool diff = false;
    bool detailedExitCode = false;
};

// Adds --check, --diff, --json and --detailed-exitcode; the first three cannot stand beside `excluded`.
void addChangeOptions(Command& command, Admin& admin, ChangeOptions& options, const Option* excluded = nullptr);

// What a run did, or would do.
struct ChangeRun {
    Status status = kSuccess;  // of the flow
    ChangeCounts counts;
    ChangeSet changes;                  // empty if only their number is shown
    std::string heading;                // text for people that comes first
    std::vector<std::string> programs;  // command lines, not started
    std::vector<std::string> notes;     // what stays otherwise than one may expect
    std::string output;                 // of the flow, where it was not written
    std::vector<ErrorLine> errors;
    ChangeSet conflicts;  // rows that others changed, so that nothing was done

    // A flow may print failures and succeed.
    bool isFailed() const;

    void set(ChangeSet all);
};

// The changes that were recorded, with a note if some of the states before could not be read.
void takeChanges(const Admin& admin, const ChangeOptions& options, const RecordedPorts& recorded, ChangeRun& run);

// Makes changes on the ports of a run.
Answer makeChanges(Admin& admin, const Ports& ports, const ChangeSet& changes);

// Commits a run that holds its commits, and takes its changes.
Answer commitRun(Admin& admin, const ChangeOptions& options, RecordedPorts& recorded, const std::string& name,
                 ChangeRun& run);

// Adds what a run that keeps no list of its error lines wrote on standard error.
void takeErrorLines(const std::string& text, ChangeRun& run);

// Fills a preview with the machine's state and reports a failure.
Answer fillPreview(Admin& admin, Preview& preview);

// Shows what a preview foretells; `run` holds what the flow itself returned.
Answer showPreview(Admin& admin, const ChangeOptions& options, Preview& preview, ChangeRun& run);

// Writes the run as text or JSON. kAnswerNo for a run that failed; with --detailed-exitcode, kAnswerChanged for one
// that succeeded and changes something.
Answer showRun(Admin& admin, const ChangeOptions& options, const ChangeRun& run);

}  // namespace kz7
