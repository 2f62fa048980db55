// Any file is refused with a line and a reason, or its keywords are the same after they are written and read again; as
// a catalogue it leaves all texts usable.
#include <algorithm>

#include "fuzz/fuzzer.h"
#include "install/runtime/message_catalogue.h"
#include "install/runtime/response_file.h"

void tryInput(std::string_view input) {
    const auto lines = static_cast<std::uint32_t>(std::count(input.begin(), input.end(), '\n')) + 1;
    std::vector<kz7::ResponseKeyword> keywords;
    kz7::ResponseFault fault;
    if (kz7::parseResponseFile(input, keywords, fault) != kz7::kSuccess) {
        check(keywords.empty() && fault.line >= 1 && fault.line <= lines && !fault.reason.empty());
        return;
    }
    std::string again;
    for (const kz7::ResponseKeyword& keyword : keywords) {
        again += keyword.name + "=\"";
        for (const char c : keyword.value) {
            again.append(c == '"' ? 2 : 1, c);
        }
        again += "\"\n";
    }
    std::vector<kz7::ResponseKeyword> second;
    check(kz7::parseResponseFile(again, second, fault) == kz7::kSuccess);
    check(std::equal(keywords.begin(), keywords.end(), second.begin(), second.end(),
                     [](const auto& a, const auto& b) { return a.name == b.name && a.value == b.value; }));
    kz7::MessageCatalogue catalogue;
    catalogue.load(input, fault);
    const kz7::Insert inserts[] = {"%s", 1U, 2U, "%n"};
    for (const std::uint32_t number : {997U, 2013U, 2035U, 5057U}) {
        char room[64];
        std::size_t length = 0;
        const kz7::Status status = catalogue.copyText(number, inserts, room, sizeof room, length);
        check(status == (length > sizeof room ? kz7::kBufferTooSmall : kz7::kSuccess));
    }
}
