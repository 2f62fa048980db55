// The stream for a front end: every info as lines of the progress protocol on standard output, answers on
// standard input.
#pragma once

#include "install/runtime/observers/kz7iobs.h"
#include "install/runtime/ure.h"

namespace kz7 {

// At most one per process; its creation and destruction write the first and the last line of the protocol. The engine
// outlives it; callers that register it unregister it before it is destroyed.
class UREExternalObserverMachineStream final : public UREExternalObserverStream {
public:
    // Creates it on the first call and writes INSTALLSTART. Null: no memory.
    static UREExternalObserverMachineStream* getInstance(URE& ure);

    // Destroys it, if it exists, and writes INSTALLEND with the path of the log, which must still exist.
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
