#include "install/admin/change_report.h"

#include <sstream>

#include "install/admin/formats/change_text.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

std::string_view withoutLineEnd(std::string_view line) {
    return line.substr(0, line.find_last_not_of('\n') + 1);
}

Answer showJson(Admin& admin, const ChangeRun& run, const ChangeOptions& options) {
    JsonWriter json = beginDocument();
    json.field("check", options.check).field("changed", !run.counts.isEmpty()).field("status", run.status);
    appendChanges(run.changes, json.field("changes"));
    if (options.diff) {
        json.field("diff", changeText(run.changes, false));
    }
    json.field("programs", run.programs).field("notes", run.notes).field("output", run.output);
    json.field("errors").beginArray();
    for (const ErrorLine& error : run.errors) {
        json.beginObject().field("line", error.line).field("status", error.status).field("failure", error.isFailure);
        json.field("text", withoutLineEnd(error.text)).end();
    }
    appendChanges(run.conflicts, json.end().field("conflicts"));
    return admin.writeJson(json);
}

std::string runText(const ChangeRun& run, const ChangeOptions& options, bool isColoured) {
    std::string text = run.heading + (options.diff ? changeText(run.changes, isColoured) : std::string{});
    for (const std::string& note : run.notes) {
        text += markedLine('!', note, isColoured);
    }
    for (const std::string& program : run.programs) {
        text += markedLine('>', "would run " + shownText(program), isColoured);
    }
    for (const Change& change : run.conflicts) {
        text += markedLine('!', shownRow(change), isColoured);
    }
    return text + changeSummary(run.counts, options.check ? "would change" : "changed") + '\n';
}

}  // namespace

void addChangeOptions(Command& command, Admin& admin, ChangeOptions& options, const Option* excluded) {
    auto check = command.flag("--check", options.check, "Change nothing; tell what would change");
    auto diff = command.flag("--diff", options.diff, "Show each change");
    auto json = command.json(admin);
    command.flag("--detailed-exitcode", options.detailedExitCode, "Exit with 3 if something changed");
    if (excluded != nullptr) {
        check.excludes(*excluded);
        diff.excludes(*excluded);
        json.excludes(*excluded);
    }
}

bool ChangeRun::isFailed() const {
    return status != kSuccess || !conflicts.empty() || hasFailure(errors);
}

void ChangeRun::set(ChangeSet all) {
    counts = countChanges(all);
    changes = std::move(all);
}

void takeChanges(const Admin& admin, const ChangeOptions& options, const RecordedPorts& recorded, ChangeRun& run) {
    run.counts = recorded.counts();
    if (options.diff || admin.isJson) {
        run.changes = recorded.changes();
    }
    if (const Status status = recorded.status(); status != kSuccess) {
        run.notes.push_back(compose("some changes are not shown: their keys could not be read: error %u", {status}));
    }
}

Answer makeChanges(Admin& admin, const Ports& ports, const ChangeSet& changes) {
    std::string key;
    const Status status =
        applyChangeSet(*ports.registry, admin.platform().storeIsOwn() ? nullptr : ports.services, changes, key);
    return status == kSuccess ? kAnswerYes : admin.storeFault("cannot change: " + shownText(key), status);
}

Answer commitRun(Admin& admin, const ChangeOptions& options, RecordedPorts& recorded, const std::string& name,
                 ChangeRun& run) {
    const Status status = recorded.commit();
    takeChanges(admin, options, recorded, run);
    return status == kSuccess ? kAnswerYes : admin.storeFault("cannot save changes: " + name, status);
}

Answer fillPreview(Admin& admin, Preview& preview) {
    std::string key;
    const Status status = preview.fill(key);
    return status == kSuccess ? kAnswerYes : admin.storeFault("cannot read: " + shownText(key), status);
}

void takeErrorLines(const std::string& text, ChangeRun& run) {
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);) {
        run.errors.push_back({0, run.status, line});
    }
}

Answer showPreview(Admin& admin, const ChangeOptions& options, Preview& preview, ChangeRun& run) {
    run.set(preview.changes());
    run.programs = preview.programs();
    run.output = preview.console().output;
    if (!admin.isJson) {
        admin.platform().console().writeError(preview.console().error);
    } else if (run.errors.empty()) {
        takeErrorLines(preview.console().error, run);
    }
    return showRun(admin, options, run);
}

Answer showRun(Admin& admin, const ChangeOptions& options, const ChangeRun& run) {
    const Answer written =
        admin.isJson ? showJson(admin, run, options) : admin.write(runText(run, options, admin.output().colours));
    if (written != kAnswerYes || run.isFailed()) {
        return written != kAnswerYes ? written : kAnswerNo;
    }
    return options.detailedExitCode && !run.counts.isEmpty() ? kAnswerChanged : kAnswerYes;
}

}  // namespace kz7
