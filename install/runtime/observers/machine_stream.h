// The stream for a front end: every info as lines of the progress protocol on standard output, answers on
// standard input.
#pragma once

#include "install/runtime/observers/kz7iobs.h"
#include "install/runtime/ure.h"

namespace kz7 {

// There is at most one per process; its life brackets the protocol. The engine outlives it, and whoever
// registered it with the engine unregisters it before it ends.
class UREExternalObserverMachineStream final : public UREExternalObserverStream {
public:
    // Makes it on the first request, which tells the front end that the run begins. Null: no memory.
    static UREExternalObserverMachineStream* getInstance(URE& ure);

    // Ends it, if there is one: the front end is told the log file. The log lives longer.
    static void release();

    Status handleProgress(UREProgressInfo& info) override;
    Status handleMessage(UREInfo& info) override;
    void handleQuery(UREInfo& info) override;

private:
    UREExternalObserverMachineStream(URE& ure, std::unique_ptr<UREExternalOutput> output);
    ~UREExternalObserverMachineStream() override;

    Status queueTaskList(std::string_view list);

    URE& ure_;
};

}  // namespace kz7
