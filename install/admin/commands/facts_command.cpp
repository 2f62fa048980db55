#include "install/admin/commands/commands.h"
#include "install/admin/copy_table.h"
#include "install/admin/findings.h"
#include "install/admin/open_machine.h"

namespace kz7 {
namespace {

void appendPrograms(JsonWriter& json) {
    json.beginArray();
    for (const std::string_view program : {"kz7InstallReg", "kz7admin", "kz7runtime"}) {
        json.beginObject().field("name", program).field("version", KZ7_VERSION).end();
    }
    json.end();
}

void appendHost(IHostInformation& host, JsonWriter& json) {
    OperatingSystem system;
    host.operatingSystem(system);
    json.beginObject().field("name", system.name).field("version", system.version);
    json.field("release", system.release).end();
}

void appendServices(const MachineState& machine, JsonWriter& json) {
    json.beginArray();
    for (const ServiceRow& service : machine.services) {
        json.beginObject().field("name", service.name).field("copy", service.copy);
        json.field("program", service.program).field("start", service.start).end();
    }
    json.end();
}

Answer showFacts(Admin& admin) {
    MachineState machine;
    if (const Answer read = openWholeMachine(admin, machine); read != kAnswerYes) {
        return read;
    }
    const std::vector<CopyLine> copies = copyLines(machine, admin.platform().services(), {}, true);
    JsonWriter json = beginDocument();
    json.field("store", admin.platform().storeName());
    appendHost(admin.platform().host(), json.field("host"));
    appendPrograms(json.field("programs"));
    json.field("backup", machine.hasBackup);
    appendCopies(copies, {}, json.field("copies"));
    appendAliases(aliasRows(machine), json.field("aliases"));
    appendServices(machine, json.field("services"));
    appendFindings(findFindings(machine, admin.platform().files(), true), json.field("findings"));
    return admin.platform().storeFaultTold() ? kAnswerFault : admin.writeJson(json);
}

}  // namespace

void addFactsCommand(Command& program, Admin& admin) {
    auto command = program.add("facts", "Write what is known of the machine as JSON");
    command.answerWith(admin, [&admin] { return showFacts(admin); });
    command.json(admin, "The same, and errors as JSON too");
}

}  // namespace kz7
