// The process port on Windows; handles are the system's.
#pragma once

#include "install/platform/process_host.h"

namespace kz7 {

class WindowsProcessHost final : public IProcessHost {
public:
    Status getSlot(StandardSlot slot, StreamHandle& stream) override;
    Status setSlot(StandardSlot slot, StreamHandle stream) override;
    Status createPipe(StreamHandle& readEnd, StreamHandle& writeEnd) override;
    Status duplicate(StreamHandle stream, StreamHandle& copy) override;
    Status read(StreamHandle stream, Buffer& data) override;
    Status write(StreamHandle stream, std::string_view data) override;
    Status closeStream(StreamHandle stream) override;
    Status startProcess(const ProcessStart& start, ProcessInformation& started) override;
    Status waitProcess(ProcessHandle process, std::uint32_t milliseconds) override;
    Status exitCode(ProcessHandle process, std::uint32_t& code) override;
    Status closeProcess(ProcessHandle process) override;
    Status shortPath(std::string_view path, Buffer& shortened) override;
};

}  // namespace kz7
