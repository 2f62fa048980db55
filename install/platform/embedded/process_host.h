// The process port on POSIX. Handles and what the standard-handle slots hold are tokens of this object,
// never descriptors.
#pragma once

#include <sys/types.h>

#include <array>
#include <map>
#include <string>

#include "install/platform/embedded/descriptor_table.h"
#include "install/platform/process_host.h"

namespace kz7 {

// Puts right what a program may have inherited and the rest relies on; called first thing. Standard
// descriptors that are closed are opened on /dev/null, so that no file of ours takes their number, and
// the end of a child is not ignored.
void settleInheritedState();

class EmbeddedProcessHost final : public IProcessHost {
public:
    explicit EmbeddedProcessHost(std::string stateDirectory);

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

private:
    struct Child {
        pid_t id = 0;
        bool ended = false;
        std::uint32_t exitCode = kExitCodeRunning;
    };

    Child* childOf(ProcessHandle process);
    Status takeEnding(Child& child, int options);
    Status spawn(const std::string& file, std::string_view program, std::string_view arguments,
                 const ProcessStart& start, ProcessInformation& started);

    std::string stateDirectory_;
    std::array<StreamHandle, 2> slots_;
    DescriptorTable<StreamHandle> streams_;
    std::map<ProcessHandle, Child> children_;
    std::uint64_t lastProcess_ = 0;
};

}  // namespace kz7
