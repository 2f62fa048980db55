// A question consumes one line of any input and is answered, aborted or unchanged.
#include "fuzz/fuzzer.h"
#include "tests/support/runtime_machine.h"

void tryInput(std::string_view input) {
    using Response = kz7::UREInfo::Response;
    kz7::test::RuntimeMachine machine;
    machine.terminal_.input = input;
    machine.engine.registerObserver(*kz7::UREExternalObserverMachineStream::getInstance(machine.engine));
    std::string answer = "unchanged";
    const Response response = machine.engine.ask(1, kz7::kMediumNeededMessage, {}, "", answer);
    check((response == Response::aborted) == input.starts_with("ABORT"));
    check(response != Response::answered || (input.starts_with("RESPONSE") && answer.empty()));
    const std::size_t line = input.find('\n');
    check(machine.terminal_.input == (line == std::string::npos ? "" : input.substr(line + 1)));
}
