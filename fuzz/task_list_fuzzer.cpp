// The lines of any task list keep their maximum length and contain no line end, and a reader finds as many fields as
// were counted unless the list was cut.
#include "fuzz/fuzzer.h"
#include "install/admin/front/protocol_reader.h"
#include "install/runtime/observers/protocol_lines.h"

void tryInput(std::string_view input) {
    const kz7::TaskListLines lines = kz7::taskListLines(input);
    const std::string_view counted = lines.count.view();
    check(counted.ends_with('\n') && counted.find_first_of("\r\n") + 1 == counted.size());
    const kz7::ProtocolEvent count = kz7::readProtocolLine(counted.substr(0, counted.size() - 1));
    check(count.kind == kz7::EventKind::taskCount && count.task >= 0 && count.task <= 1024);
    const bool plain = input.find_first_of(" \r\n:") == std::string_view::npos;
    for (const std::string_view line : {lines.identifiers.view(), lines.times.view()}) {
        check(line.size() <= 1024 && line.find_first_of(std::string_view("\r\n\0", 3)) == std::string_view::npos);
        // After an empty last field nothing follows the separator.
        const kz7::ProtocolEvent event = kz7::readProtocolLine(line);
        const auto fields = static_cast<std::int32_t>(event.fields.size()) + (line.ends_with(" :: ") ? 1 : 0);
        check(!plain || line.size() == 1024 || fields == count.task);
    }
}
