// Whatever a front end sends, a question takes one line of it and is answered, aborted or left as it was.
#include <cstdint>
#include <cstdlib>
#include <string>

#include "install/runtime/observers/protocol_lines.h"
#include "tests/support/runtime_machine.h"

namespace {

void check(bool holds) {
    if (!holds) {
        std::abort();
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    using Response = kz7::UREInfo::Response;
    kz7::test::RuntimeMachine machine;
    machine.lines_.input.assign(reinterpret_cast<const char*>(data), size);
    const std::string input = machine.lines_.input;
    auto* stream = kz7::UREExternalObserverMachineStream::getInstance(machine.engine);
    machine.engine.registerObserver(*stream);
    std::string answer = "unchanged";
    const Response response = machine.engine.ask(1, kz7::kMediumNeededMessage, {}, "", answer);
    check((response == Response::aborted) == input.starts_with("ABORT"));
    check(response != Response::answered || (input.starts_with("RESPONSE") && answer.empty()));
    const std::size_t line = input.find('\n');
    check(machine.lines_.input == (line == std::string::npos ? "" : input.substr(line + 1)));
    return 0;
}
