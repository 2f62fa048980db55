#include "install/admin/change_report.h"

#include <sstream>

#include "install/admin/formats/change_text.h"
#include "install/admin/formats/json_text.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

void appendTexts(std::string_view name, const std::vector<std::string>& texts, std::string& json) {
    std::string_view separator;
    json.append(",\"").append(name).append("\":[");
    for (const std::string& text : texts) {
        json += separator;
        appendJsonText(text, json);
        separator = ",";
    }
    json += ']';
}

std::string runJson(const ChangeRun& run, bool isCheck) {
    std::string json = compose("{\"schema\":1,\"check\":%s,\"changed\":%s,\"status\":%u,\"changes\":",
                               {isCheck ? "true" : "false", run.changes.empty() ? "false" : "true", run.status});
    appendChangesJson(run.changes, json);
    appendTexts("programs", run.programs, json);
    appendTexts("notes", run.notes, json);
    json += ",\"output\":";
    appendJsonText(run.output, json);
    std::string_view separator;
    json += ",\"errors\":[";
    for (const ErrorLine& error : run.errors) {
        json += separator;
        json += compose("{\"line\":%u,\"status\":%u,\"failure\":%s,\"text\":",
                        {error.line, error.status, error.isFailure ? "true" : "false"});
        appendJsonText(std::string_view(error.text).substr(0, error.text.find_last_not_of('\n') + 1), json);
        json += '}';
        separator = ",";
    }
    json += "],\"conflicts\":";
    appendChangesJson(run.conflicts, json);
    return json + "}\n";
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
    return text + changeSummary(run.changes, options.check ? "would change" : "changed") + '\n';
}

}  // namespace

void addChangeOptions(Command& command, ChangeOptions& options, const Option* excluded) {
    auto check = command.flag("--check", options.check, "Change nothing; tell what would change");
    auto diff = command.flag("--diff", options.diff, "Show each change");
    auto json = command.flag("--json", options.json, "Write JSON for programs");
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

void takeChanges(const RecordedPorts& recorded, ChangeRun& run) {
    run.changes = recorded.changes();
    if (const Status status = recorded.status(); status != kSuccess) {
        run.notes.push_back(compose("some changes are not shown: their keys could not be read: error %u", {status}));
    }
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
    run.changes = preview.changes();
    run.programs = preview.programs();
    run.output = preview.console().output;
    if (!options.json) {
        admin.platform().console().writeError(preview.console().error);
    } else if (run.errors.empty()) {
        takeErrorLines(preview.console().error, run);
    }
    return showRun(admin, options, run);
}

Answer showRun(Admin& admin, const ChangeOptions& options, const ChangeRun& run) {
    const Answer written = options.json ? admin.write(runJson(run, options.check), Admin::Form::document)
                                        : admin.write(runText(run, options, admin.output().colours));
    if (written != kAnswerYes || run.isFailed()) {
        return written != kAnswerYes ? written : kAnswerNo;
    }
    return options.detailedExitCode && !run.changes.empty() ? kAnswerChanged : kAnswerYes;
}

}  // namespace kz7
