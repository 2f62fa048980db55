// The process port in memory: programs are rows of a table with their output and exit code. A program runs to its end
// inside the call that starts it; use it with MemoryThreads.
#pragma once

#include <array>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "install/platform/handle_table.h"
#include "install/platform/process_host.h"

namespace kz7 {

struct ScriptedProgram {
    std::string output = {};
    std::string error = {};
    std::uint32_t exitCode = 0;
    bool runsOn =
        false;  // still runs after every wait with a limit and holds its pipes; ends in a wait without a limit
};

class MemoryProcessHost final : public IProcessHost {
public:
    // Paths compare without case and are written as in command lines, without quotation marks.
    void addProgram(std::string_view path, ScriptedProgram program);

    std::optional<ScriptedProgram>
        otherPrograms;                 // the result of programs that were not added; empty: they do not exist
    std::vector<std::string> started;  // the command lines of the programs that were started, in order
    std::size_t openHandles() const { return streams_.size() + children_.size(); }

    Status getSlot(StandardSlot slot, StreamHandle& stream) override;
    Status setSlot(StandardSlot slot, StreamHandle stream) override;
    Status createPipe(StreamHandle& readEnd, StreamHandle& writeEnd) override;
    Status duplicate(StreamHandle stream, StreamHandle& copy) override;

    // kWaitTimedOut if the wait would never end, because no other thread can write.
    Status read(StreamHandle stream, Buffer& data) override;
    Status write(StreamHandle stream, std::string_view data) override;
    Status closeStream(StreamHandle stream) override;
    Status startProcess(const ProcessStart& start, ProcessInformation& information) override;
    Status waitProcess(ProcessHandle process, std::uint32_t milliseconds) override;
    Status exitCode(ProcessHandle process, std::uint32_t& code) override;
    Status closeProcess(ProcessHandle process) override;
    Status shortPath(std::string_view path, Buffer& shortened) override;

private:
    // The ends of a pipe share its bytes. An end is closed when its last token is closed.
    struct End {};
    struct Pipe {
        std::string bytes;
        std::weak_ptr<End> readers;
        std::weak_ptr<End> writers;
    };
    struct Stream {
        std::shared_ptr<Pipe> pipe;
        std::shared_ptr<End> end;
    };
    struct Child {
        std::uint32_t exitCode = 0;
        bool runsOn = false;
        std::vector<Stream> held;
    };

    const ScriptedProgram* find(std::string_view commandLine) const;

    std::map<std::string, ScriptedProgram> programs_;  // by upper-cased path
    std::array<StreamHandle, 2> slots_{StreamHandle{1}, StreamHandle{2}};
    HandleTable<StreamHandle, Stream> streams_{2};
    HandleTable<ProcessHandle, Child> children_;
};

}  // namespace kz7
