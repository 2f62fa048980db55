#include "install/admin/open_machine.h"

#include "install/admin/run_history.h"

namespace kz7 {

Answer openMachine(Admin& admin, Depth depth, MachineState& machine) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    std::string key;
    const Status status = readMachine(admin.registry(), depth, machine, key);
    if (status != kSuccess || admin.platform().storeFaultTold()) {
        return admin.storeFault("cannot read: " + shownText(key), status);
    }
    return kAnswerYes;
}

Answer openWholeMachine(Admin& admin, MachineState& machine) {
    if (const Answer read = openMachine(admin, Depth::whole, machine); read != kAnswerYes) {
        return read;
    }
    machine.store = admin.platform().storeName();
    if (const Status status = admin.platform().examineStore(machine.damages); status != kSuccess) {
        return admin.storeFault("cannot examine store", status);
    }
    std::vector<HistoryRun> runs;
    if (const Answer listed = listRuns(admin, runs); listed != kAnswerYes) {
        return listed;
    }
    for (const HistoryRun& run : unfinishedRuns(runs)) {
        machine.interruptedRuns.push_back({std::to_string(run.number), commandOf(run)});
    }
    return kAnswerYes;
}

}  // namespace kz7
