#include <algorithm>

#include "install/admin/commands/commands.h"
#include "install/admin/findings.h"
#include "install/admin/open_machine.h"

namespace kz7 {
namespace {

struct CheckOptions {
    std::string copy;
    bool all = false;
};

std::string findingsText(const std::vector<Finding>& findings) {
    std::string text;
    for (const Finding& finding : findings) {
        text += findingLine(finding);
    }
    return text;
}

Answer showJson(Admin& admin, const std::vector<Finding>& findings) {
    JsonWriter json = beginDocument();
    appendFindings(findings, json.field("store", admin.platform().storeName()).field("findings"));
    return admin.writeJson(json);
}

Answer check(Admin& admin, const CheckOptions& options) {
    MachineState machine;
    if (const Answer read = openWholeMachine(admin, machine); read != kAnswerYes) {
        return read;
    }
    std::vector<Finding> findings = findFindings(machine, admin.platform().files(), options.all);
    if (!options.copy.empty()) {
        std::erase_if(findings, [&](const Finding& one) { return !equalsIgnoreCase(one.copy, options.copy); });
        if (findings.empty() && machine.find(options.copy) == nullptr) {
            return admin.no("no such copy: " + shownText(options.copy) + " (see kz7admin copies)");
        }
    }
    const Answer written = admin.isJson ? showJson(admin, findings) : admin.write(findingsText(findings));
    const bool isInOrder = std::none_of(findings.begin(), findings.end(),
                                        [](const Finding& one) { return one.kind().mark == Mark::fault; });
    return written != kAnswerYes || isInOrder ? written : kAnswerNo;
}

}  // namespace

void addCheckCommand(Command& program, Admin& admin) {
    auto command = program.add("check", "Report what is not in order and its repair");
    auto& options = command.answerWith(admin, check);
    command.describe("Prints nothing and exits with 0 if all is in order, else with 1. Notes do not\ncount.");
    command.text("NAME", options.copy, "Only what belongs to this copy");
    command.flag("--all", options.all, "Also what is deliberate or not installed yet");
    command.json(admin);
}

}  // namespace kz7
