// Whatever a task list holds, its lines keep to their lengths and to one line each, and a reader finds as many
// fields as were counted where nothing was cut.
#include <cstdint>
#include <cstdlib>
#include <string>

#include "install/admin/protocol_reader.h"
#include "install/runtime/observers/protocol_lines.h"

namespace {

void check(bool holds) {
    if (!holds) {
        std::abort();
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view list(reinterpret_cast<const char*>(data), size);
    const kz7::TaskListLines lines = kz7::taskListLines(list);
    check(lines.count.view().ends_with('\n') &&
          lines.count.view().find_first_of("\r\n") + 1 == lines.count.view().size());
    const kz7::ProtocolEvent count = kz7::readProtocolLine(lines.count.view().substr(0, lines.count.view().size() - 1));
    check(count.kind == kz7::EventKind::taskCount && count.task >= 0 && count.task <= 1024);
    for (const std::string_view line : {lines.identifiers.view(), lines.times.view()}) {
        check(line.size() <= 1024 && line.find_first_of(std::string_view("\r\n\0", 3)) == std::string_view::npos);
        const bool plain = list.find("::") == std::string_view::npos && list.find(' ') == std::string_view::npos &&
                           list.find_first_of(std::string_view("\r\n:", 3)) == std::string_view::npos;
        // A last field that is empty leaves a separator behind which nothing comes.
        const kz7::ProtocolEvent event = kz7::readProtocolLine(line);
        const auto fields = static_cast<std::int32_t>(event.fields.size()) + (line.ends_with(" :: ") ? 1 : 0);
        check(!plain || line.size() == 1024 || fields == count.task);
    }
    return 0;
}
