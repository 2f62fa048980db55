#include "install/platform/memory/process_host.h"

#include "install/platform/command_line.h"
#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {

void MemoryProcessHost::addProgram(std::string_view path, ScriptedProgram program) {
    programs_[foldUpper(path)] = std::move(program);
}

Status MemoryProcessHost::getSlot(StandardSlot slot, StreamHandle& stream) {
    stream = slots_[static_cast<std::size_t>(slot)];
    return kSuccess;
}

Status MemoryProcessHost::setSlot(StandardSlot slot, StreamHandle stream) {
    slots_[static_cast<std::size_t>(slot)] = stream;
    return kSuccess;
}

Status MemoryProcessHost::createPipe(StreamHandle& readEnd, StreamHandle& writeEnd) {
    const auto pipe = std::make_shared<Pipe>();
    const auto reader = std::make_shared<End>();
    const auto writer = std::make_shared<End>();
    pipe->readers = reader;
    pipe->writers = writer;
    readEnd = streams_.give({pipe, reader});
    writeEnd = streams_.give({pipe, writer});
    return kSuccess;
}

Status MemoryProcessHost::duplicate(StreamHandle stream, StreamHandle& copy) {
    const Stream* const found = streams_.find(stream);
    if (found == nullptr) {
        return kInvalidHandle;
    }
    copy = streams_.give(*found);
    return kSuccess;
}

Status MemoryProcessHost::read(StreamHandle stream, Buffer& data) {
    const Stream* const found = streams_.find(stream);
    if (found == nullptr) {
        return kInvalidHandle;
    }
    Pipe& pipe = *found->pipe;
    if (pipe.bytes.empty()) {
        return pipe.writers.expired() ? kBrokenPipe : kWaitTimedOut;
    }
    data.size = static_cast<std::uint32_t>(pipe.bytes.copy(data.data, data.capacity));
    pipe.bytes.erase(0, data.size);
    return kSuccess;
}

Status MemoryProcessHost::write(StreamHandle stream, std::string_view data) {
    const Stream* const found = streams_.find(stream);
    if (found == nullptr) {
        return kInvalidHandle;
    }
    Pipe& pipe = *found->pipe;
    if (pipe.readers.expired()) {
        return kPipeClosing;
    }
    pipe.bytes += data;
    return kSuccess;
}

Status MemoryProcessHost::closeStream(StreamHandle stream) {
    return streams_.close(stream) ? kSuccess : kInvalidHandle;
}

const ScriptedProgram* MemoryProcessHost::find(std::string_view commandLine) const {
    for (const CommandReading& reading : commandReadings(commandLine)) {
        const auto found = programs_.find(foldUpper(reading.program));
        if (found != programs_.end()) {
            return &found->second;
        }
    }
    return otherPrograms ? &*otherPrograms : nullptr;
}

Status MemoryProcessHost::startProcess(const ProcessStart& start, ProcessInformation& information) {
    const ScriptedProgram* program = find(start.commandLine);
    if (program == nullptr) {
        return kFileNotFound;
    }
    started.emplace_back(start.commandLine);
    Child child{program->exitCode, program->runsOn, {}};
    for (const auto& [stream, text] : {std::pair{start.output, &program->output}, {start.error, &program->error}}) {
        write(stream, *text);
        const Stream* const found = streams_.find(stream);
        if (program->runsOn && found != nullptr) {
            child.held.push_back(*found);
        }
    }
    const ProcessHandle process = children_.give(std::move(child));
    const auto id = static_cast<std::uint32_t>(process);
    information = {process, ProcessHandle::none, id, id};
    return kSuccess;
}

Status MemoryProcessHost::waitProcess(ProcessHandle process, std::uint32_t milliseconds) {
    Child* const child = children_.find(process);
    if (child == nullptr) {
        return kInvalidHandle;
    }
    if (child->runsOn && milliseconds != kInfiniteWait) {
        return kWaitTimedOut;
    }
    child->runsOn = false;
    child->held.clear();
    return kSuccess;
}

Status MemoryProcessHost::exitCode(ProcessHandle process, std::uint32_t& code) {
    const Child* const child = children_.find(process);
    if (child == nullptr) {
        return kInvalidHandle;
    }
    code = child->runsOn ? kExitCodeRunning : child->exitCode;
    return kSuccess;
}

Status MemoryProcessHost::closeProcess(ProcessHandle process) {
    return children_.close(process) ? kSuccess : kInvalidHandle;
}

Status MemoryProcessHost::shortPath(std::string_view path, Buffer& shortened) {
    // Removes the blanks only, which is enough to distinguish a shortened path.
    if (!programs_.contains(foldUpper(path))) {
        return kFileNotFound;
    }
    std::string text(path);
    std::erase(text, ' ');
    return giveName(text, shortened);
}

}  // namespace kz7
