#include "install/admin/commands/commands.h"
#include "install/admin/formats/change_text.h"
#include "install/admin/formats/fleet_page.h"
#include "install/admin/formats/html_report.h"
#include "install/admin/input_file.h"
#include "install/admin/open_machine.h"
#include "install/admin/run_history.h"

namespace kz7 {
namespace {

struct ReportOptions {
    std::vector<std::string> fleet;  // files with facts
    std::string file;
    bool force = false;
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

// A machine is named by its file, not by itself.
std::string machineName(std::string_view file) {
    file.remove_prefix(file.find_last_of("/\\") + 1);
    file.remove_suffix(file.ends_with(".json") ? 5 : 0);
    return std::string(file);
}

// A file that cannot be used is a row of the page, and the answer is no.
Answer readFleet(Admin& admin, const std::vector<std::string>& files, std::string& html) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    std::map<std::string, std::string> byName;
    for (const std::string& file : files) {
        if (const auto [other, isNew] = byName.try_emplace(machineName(file), file); !isNew) {
            return admin.fault("two files for one machine: " + shownText(other->second) + " and " + shownText(file));
        }
    }
    Fleet fleet;
    Answer answer = kAnswerYes;
    for (const auto& [machine, path] : byName) {
        InputFile file(admin, path);
        const bool isRead = file.read() == kAnswerYes;
        std::string& fault = fleet.add(machine, file.bytes()).fault;
        if (!isRead) {
            fault = "its file cannot be read";
        } else if (!fault.empty()) {
            admin.tell(file.shown() + ": " + fault);
        }
        answer = fault.empty() ? answer : kAnswerNo;
    }
    html = fleetPage(fleet, timeNow(admin.platform().host()));
    return answer;
}

Answer writeReport(Admin& admin, const ReportOptions& options, const std::string& html) {
    if (options.file.empty()) {
        return admin.write(html, Admin::Form::document);
    }
    if (const Answer written = admin.writeFile("report", options.file, html, options.force); written != kAnswerYes) {
        return written;
    }
    if (admin.isJson) {
        JsonWriter json = beginDocument();
        if (options.fleet.empty()) {
            json.field("store", admin.platform().storeName());
        }
        return admin.writeJson(json.field("file", options.file));
    }
    return admin.write("wrote " + shownText(options.file) + '\n');
}

Answer report(Admin& admin, const ReportOptions& options) {
    std::string html;
    const Answer read = options.fleet.empty() ? readReport(admin, html) : readFleet(admin, options.fleet, html);
    if (html.empty() || read == kAnswerFault) {
        return read;
    }
    const Answer written = writeReport(admin, options, html);
    return written == kAnswerYes ? read : written;
}

}  // namespace

void addReportCommand(Command& program, Admin& admin) {
    auto command = program.add("report", "Write one HTML page about the machine");
    auto& options = command.answerWith(admin, report);
    auto file = command.text("-o,--output", options.file, "The file to make; without: standard output");
    file.isFileName();
    command.texts("--fleet", options.fleet, "Describe many machines, by what facts wrote there");
    command.flag("--force", options.force, "Replace an existing file").needs(file);
    command.json(admin, "Write JSON about the file for programs").needs(file);
}

}  // namespace kz7
