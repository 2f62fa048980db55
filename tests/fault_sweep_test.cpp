// Every call of every flow fails in turn, once and for good: the flow ends, reports it, leaks nothing and does not
// change what it must not touch. A new flow is a new row.
#include <gtest/gtest.h>

#include <cstring>
#include <map>
#include <set>
#include <sstream>

#include "install/src/services/management_service.h"
#include "tests/support/fault_sweep.h"

namespace kz7::test {
namespace {

const std::string kCopies = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies";

int tellLevel(std::uint32_t, char* level) {
    std::strcpy(level, "KZ7 v9.1.0.0");
    return 0;
}

void twoCopies(FaultyMachine& machine) {
    machine.run({"-addKZ7Copy", "FIRST", "C:\\first"});
    machine.run({"-addKZ7Copy", "SECOND", "C:\\second"});
    machine.set("SOFTWARE\\Other", "v", "somebody else's");
    machine.set("SOFTWARE\\NVQ\\KZ7BackupV8\\PROFILES", "", "backup");
    for (const char* profile : {"GLOBAL_PROFILE", "PROFILES\\INST", "DAS_PROFILES"}) {
        machine.set("SOFTWARE\\NVQ\\KZ7\\" + std::string(profile), "v", "version 8");
    }
    machine.addService("KZ7MGMTSVC", false);
    machine.libraries_.libraries["C:\\KZ9\\bin\\kz7install64.dll"]["sqleGetLevelInfo"] =
        reinterpret_cast<LibraryFunction>(tellLevel);
    machine.files_.add("C:\\KZ9\\bin\\kz7mgmtsvc.exe");
    for (const char* program : {"kz7nmpgac32.exe", "kz7nmpcfg.exe", "kz7nmpcfg_32.exe"}) {
        const std::string path = "C:\\KZ9\\bin\\" + std::string(program);
        machine.files_.add(path);
        machine.processes_.addProgram(path, {});
    }
}

struct SweptFlow {
    char mark;  // in the table of lines
    std::vector<std::string> arguments;
};

const SweptFlow kSwept[] = {
    {'a', {"-addKZ7Copy", "THIRD", "C:\\third"}},
    {'b', {"-addKZ7Copy", "FIRST", "C:\\moved"}},
    {'r', {"-removeKZ7Copy", "FIRST"}},
    {'u', {"-removeKZ7Copy", "NONE"}},
    {'8', {"-v8", "C:\\KZ8"}},
    {'9', {"-v9", "C:\\KZ9"}},
    {'d', {"-dotnet", "C:\\KZ9"}},
    {'v', {"-addv9", "THIRD", "C:\\third"}},
    {'s', {"start of a new service"}},
};

// No option starts a service that it has just created.
Status runFlow(const SweptFlow& flow, FaultyMachine& machine) {
    if (flow.mark != 's') {
        return machine.run(flow.arguments);
    }
    Report report(machine.console());
    return registerManagementService(machine.registry(), machine.services(), report, "C:\\KZ9", "NEW", true);
}

// Every error line that those failures cause, with the flows that report it, except the lines that name a registry row.
// Support staff search for the line numbers and texts.
const std::map<std::string, std::string> kErrorLines = {
    // clang-format off
    {":1241: An error occurred while creating default version 8 registry keys", "8"},
    {":1345: Error occurred while backing up old registry", "9"},
    {":1360: Failed to copy GLOBAL_PROFILE.  You may need to update some Global Profile Registry variables.", "9"},
    {":1372: Unable to create the registry key entries for the version 9 InstallCopy", "9"},
    {":1388: Failed to copy prior instances.  You may need to run kz7icrt to create any instances that you need.", "9"},
    {":1406: Failed to DAS Profiles from Version 8.  You may need to run dascrt for the KZ7 Administration Server to work.", "9"},
    {":1466: Failed to copy copy SOFTWARE\\NVQ\\KZ7BackupV8 to SOFTWARE\\NVQ\\KZ7", "8"},
    {":1467: Create empty version 8 registry", "8"},
    {":1486: Failed to create basic registry keys or update location of the version 8 sqllib", "8"},
    {":1510: Failed open the SCM - error code 4321", "8s"},
    {":1523: Failed open the Service KZ7MGMTSVC - error code 4321", "8"},
    {":1523: Failed open the Service KZ7MGMTSVC_NEW - error code 4321", "s"},
    {":1541: Unable to update the start type of the service KZ7MGMTSVC - error 4321", "8"},
    {":1541: Unable to update the start type of the service KZ7MGMTSVC_NEW - error 4321", "s"},
    {":1552: Unable to start the service KZ7MGMTSVC_NEW - error 4321", "s"},
    {":1602: Unable to deregister the KZ7 .NET Data Provider - ", "v"},
    {":1602: Unable to deregister the KZ7 .NET Data Provider - 9.1.0", "9d"},
    {":1629: Failed to register 32-bit KZ7 .net data provider to GAC.  rc = 5082", "9d"},
    {":1636: Some provider versions were not registered in the GAC because you don't have the appropriate framework installed", "9dv"},
    {":1668: Failed to execute kz7nmpcfg.exe command.  rc = 5082", "9dv"},
    {":1689: Failed to execute kz7nmpcfg_32.exe command.  rc = 5082", "9dv"},
    {":1739: Failed open the SCM - error code 4321", "ab9vs"},
    {":1775: Failed to create service- error code 4321", "ab9vs"},
    {":1800: Failed to create Event log registry key -error 4321", "a9vs"},
    {":1816: Failed to set EventMessageFile -error 4321", "a9vs"},
    {":1838: Failed to set TypesSupported -error 4321", "a9vs"},
    {":421: Failed to copy copy SOFTWARE\\NVQ\\KZ7 to SOFTWARE\\NVQ\\KZ7BackupV8", "9"},
    {":595: Unable to resolve the sqleGetLevelInfo from C:\\KZ9\\bin\\kz7install64.dll", "9d"},
    {":601: Unable to load C:\\KZ9\\bin\\kz7install64.dll", "9d"},
    {":601: Unable to load THIRD\\bin\\kz7install64.dll", "v"},
    {":607: Unable to retrieve the version of the sqllib", "9dv"},
    {":793: Unable to set the Version registry key .NET Apps will not work", "9"},
    {":809: Unable to set the Version registry key in 32-bit registry hive. .NET Apps will not work", "9"},
    {":941: Unable to add a new copy of KZ7 to this machine : rc = 4321", "ab9v"},
    {"An error occurred while registering the KZ7 Management Service", "9"},
    {"The KZ7 Management service could not be started - some function not", "9"},
    {"yet ported to the new registry layout may not function properly", "9"},
    // clang-format on
};

TEST(FaultSweep, EveryFlowEndsReportsAndTouchesNothingElse) {
    std::map<std::string, std::string> reported;
    for (const SweptFlow& flow : kSwept) {
        SCOPED_TRACE(flow.mark);
        const std::string& option = flow.arguments[0];
        for (const bool forGood : {false, true}) {
            std::vector<std::string> cut;  // the console of the runs whose first, second, ... commit failed
            const auto check = [&](FaultyMachine& machine, Status status) {
                machine.servicesLeftOpen = option == "-v8" || flow.mark == 's' ? 2 : 0;
                EXPECT_NE(machine.dump("SOFTWARE\\Other").find("somebody else's"), std::string::npos);
                EXPECT_NE(machine.service("KZ7MGMTSVC_SECOND"), "");
                const std::string& failed = machine.faults_.failed();
                std::istringstream errors(machine.console_.error);
                for (std::string line; !forGood && std::getline(errors, line);) {
                    line.erase(0, line.starts_with(kPrefix) ? kPrefix.size() - 1 : 0);
                    if (line.ends_with("rc = 5030") || line.ends_with("rc = 5111")) {
                        line.replace(line.size() - 4, 4, "5082");
                    }
                    if (!line.starts_with(":392:") && !reported[line].ends_with(flow.mark)) {
                        reported[line] += flow.mark;
                    }
                }
                if (failed == "commit" && !forGood) {
                    EXPECT_EQ(status, kFault);
                    EXPECT_EQ(machine.registry_.commits(), 2 + cut.size()) << "the flow ends at a commit that fails";
                    cut.push_back(machine.console_.both);
                }
                for (std::size_t i = 0; i < cut.size() && failed.empty(); ++i) {
                    EXPECT_TRUE(machine.console_.both.starts_with(cut[i])) << cut[i];
                    EXPECT_NE(machine.console_.both, cut[0]);
                }
                // A failed close and a lost line of the console do not change the status.
                if (failed.starts_with("close") || failed.starts_with("write") || failed == "flush") {
                    if (!forGood && flow.mark != 'u') {
                        EXPECT_EQ(status, kSuccess);
                    }
                } else if (flow.mark == 's' && !forGood) {
                    EXPECT_EQ(status == kSuccess, machine.console_.error.empty() || failed == "changeStartType");
                    EXPECT_EQ(machine.runs("KZ7MGMTSVC_NEW"), status == kSuccess);
                } else if (option == "-addKZ7Copy") {
                    EXPECT_EQ(status, failed.empty() ? kSuccess : kFault);
                    const std::string& output = machine.console_.output;
                    EXPECT_EQ(output.find("added successfully") != std::string::npos, failed.empty());
                    EXPECT_TRUE(machine.has(kCopies + "\\SECOND\\GLOBAL_PROFILE"));
                } else if (option == "-dotnet" && !forGood && failed != "commit") {
                    EXPECT_GE(machine.processes_.started.size(), 2U) << "no step stops the next";
                    if (failed != "openKey" && failed != "setValue") {
                        EXPECT_EQ(status, kSuccess) << "else the alias rewrite decides";
                    }
                }
            };
            const auto run = [&](FaultyMachine& machine) { return runFlow(flow, machine); };
            EXPECT_GT(sweepFaults(forGood, twoCopies, run, check), 10U);
        }
    }
    EXPECT_EQ(reported, kErrorLines);
}

// What a removal deletes when one of its calls fails once: whether the product and either copy are still there. The
// list is read first: a copy that could not be read is not in it, and after a list of one copy the whole product goes.
TEST(RemovalUnderFaults, DeletesByTheListOfCopies) {
    std::map<std::string, std::set<std::string>> outcomes;
    const auto flow = [](FaultyMachine& machine) { return machine.run({"-removeKZ7Copy", "FIRST"}); };
    sweepFaults(false, twoCopies, flow, [&](FaultyMachine& machine, Status status) {
        outcomes[machine.faults_.failed()].insert(
            std::to_string(status) + (machine.has("SOFTWARE\\NVQ\\KZ7") ? " product" : "") +
            (machine.has(kCopies + "\\FIRST") ? " first" : "") + (machine.has(kCopies + "\\SECOND") ? " second" : ""));
        EXPECT_TRUE(machine.has("SOFTWARE\\NVQ\\KZ7BackupV8\\PROFILES"));
    });
    const std::set<std::string> removed = {"0 product second"};
    // clang-format off
    const std::map<std::string, std::set<std::string>> expected = {
        {"", removed}, {"closeHandle", removed}, {"closeKey", removed}, {"deleteService", removed},
        {"enumerateValue", removed}, {"openManager", removed}, {"openService", removed}, {"stopService", removed},
        {"writeOutput", removed},
        {"commit",       {"4321 product second"}},
        {"deleteKey",    {"0 product first second", "0 product second"}},
        // The list ended before FIRST or after it; the walk ended, with FIRST or without it.
        {"enumerateKey", {"5021 product first second", "0", "0 product first second", "0 product second"}},
        // FIRST could not be read, or SECOND.
        {"queryValue",   {"5021 product first second", "0"}},
        {"openKey",      {"5021 product first second", "0", "0 product first second", "0 product second"}},
    };
    // clang-format on
    EXPECT_EQ(outcomes, expected);
}

}  // namespace
}  // namespace kz7::test
