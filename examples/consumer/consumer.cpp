// The smallest program on the installed library: reports one task in the progress protocol.
#include "kz7/runtime/observers/observers_end.h"
#include "kz7/runtime/runtime_ports.h"

int main() {
    const auto platform = kz7::hostPlatform({.program = "consumer"});
    kz7::URE engine(kz7::portsOf(*platform));
    const kz7::ObserversEnd end;
    auto* const stream = kz7::UREExternalObserverMachineStream::getInstance(engine);
    if (stream == nullptr || engine.registerObserver(*stream) != kz7::kSuccess) {
        return 1;
    }
    engine.startTask(0, 1, true, "Copying files");
    engine.endTask(1, true, "Copying files");
    return 0;
}
