#include <CLI/CLI.hpp>

#include "install/admin/commands/commands.h"
#include "install/admin/formats/change_text.h"
#include "install/admin/formats/html_report.h"
#include "install/admin/given_name.h"
#include "install/admin/open_machine.h"
#include "install/admin/run_history.h"

namespace kz7 {
namespace {

struct ReportOptions {
    std::string file;
    bool force = false;
    bool json = false;
};

std::string timeNow(IHostInformation& host) {
    TextBuffer<128> time;
    return host.localTime(TimeText::dateAndZone, time) == kSuccess ? std::string(time.text()) : std::string{};
}

Answer readLastRuns(Admin& admin, std::vector<ReportedRun>& reported) {
    constexpr std::size_t kRuns = 10;
    std::vector<HistoryRun> runs;
    if (const Answer listed = listRuns(admin, runs); listed != kAnswerYes) {
        return listed;
    }
    for (auto run = runs.rbegin(); run != runs.rend() && reported.size() < kRuns; ++run) {
        ChangeSet changes;
        if (const Answer read = readRun(admin, *run, changes); read != kAnswerYes) {
            return read;
        }
        reported.push_back(
            {compose("%s %s: %s, status %s", {utcTime(run->begun), run->user, commandOf(*run), stateOf(*run)}),
             changeText(changes, false)});
    }
    return kAnswerYes;
}

Answer readReport(Admin& admin, std::string& html) {
    MachineState machine;
    if (const Answer read = openWholeMachine(admin, machine); read != kAnswerYes) {
        return read;
    }
    std::vector<ReportedRun> runs;
    if (const Answer read = readLastRuns(admin, runs); read != kAnswerYes) {
        return read;
    }
    IPlatform& platform = admin.platform();
    OperatingSystem system;
    platform.host().operatingSystem(system);
    html = htmlReport({platform.storeName(), compose("%s %s %s", {system.name, system.version, system.release}),
                       timeNow(platform.host()), machine, copyLines(machine, platform.services(), {}, false),
                       findFindings(machine, platform.files(), true), std::move(runs)});
    return platform.storeFaultTold() ? kAnswerFault : kAnswerYes;
}

Answer report(Admin& admin, const ReportOptions& options) {
    std::string html;
    if (const Answer read = readReport(admin, html); read != kAnswerYes) {
        return read;
    }
    if (options.file.empty()) {
        return admin.write(html, Admin::Form::document);
    }
    if (const Answer written = admin.writeFile("report", options.file, html, options.force); written != kAnswerYes) {
        return written;
    }
    if (options.json) {
        JsonWriter json;
        json.beginObject().field("schema", std::uint64_t{1}).field("store", admin.platform().storeName());
        return admin.write(json.field("file", options.file).end().take(), Admin::Form::document);
    }
    return admin.write("wrote " + shownText(options.file) + '\n');
}

}  // namespace

void addReportCommand(CLI::App& program, Admin& admin) {
    auto* command = program.add_subcommand("report", "Write one HTML page about the machine");
    auto options = std::make_shared<ReportOptions>();
    auto* file = command->add_option("-o,--output", options->file, "The file to make; without: standard output");
    file->check(givenName());
    command->add_flag("--force", options->force, "Replace an existing file")->needs(file);
    command->add_flag("--json", options->json, "Write JSON about the file for programs")->needs(file);
    command->callback([&admin, options] { admin.answer = [&admin, options] { return report(admin, *options); }; });
}

}  // namespace kz7
