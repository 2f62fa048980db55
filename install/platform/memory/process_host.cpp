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

StreamHandle MemoryProcessHost::giveOut(Stream stream) {
    const StreamHandle handle{++lastToken_};
    streams_.emplace(handle, std::move(stream));
    return handle;
}

Status MemoryProcessHost::createPipe(StreamHandle& readEnd, StreamHandle& writeEnd) {
    const auto pipe = std::make_shared<Pipe>();
    const auto reader = std::make_shared<End>();
    const auto writer = std::make_shared<End>();
    pipe->readers = reader;
    pipe->writers = writer;
    readEnd = giveOut({pipe, reader});
    writeEnd = giveOut({pipe, writer});
    return kSuccess;
}

Status MemoryProcessHost::duplicate(StreamHandle stream, StreamHandle& copy) {
    const auto found = streams_.find(stream);
    if (found == streams_.end()) {
        return kInvalidHandle;
    }
    copy = giveOut(found->second);
    return kSuccess;
}

Status MemoryProcessHost::read(StreamHandle stream, Buffer& data) {
    const auto found = streams_.find(stream);
    if (found == streams_.end()) {
        return kInvalidHandle;
    }
    Pipe& pipe = *found->second.pipe;
    if (pipe.bytes.empty()) {
        return pipe.writers.expired() ? kBrokenPipe : kWaitTimedOut;
    }
    data.size = static_cast<std::uint32_t>(pipe.bytes.copy(data.data, data.capacity));
    pipe.bytes.erase(0, data.size);
    return kSuccess;
}

Status MemoryProcessHost::write(StreamHandle stream, std::string_view data) {
    const auto found = streams_.find(stream);
    if (found == streams_.end()) {
        return kInvalidHandle;
    }
    Pipe& pipe = *found->second.pipe;
    if (pipe.readers.expired()) {
        return kPipeClosing;
    }
    pipe.bytes += data;
    return kSuccess;
}

Status MemoryProcessHost::closeStream(StreamHandle stream) {
    return streams_.erase(stream) != 0 ? kSuccess : kInvalidHandle;
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
        const auto found = streams_.find(stream);
        if (program->runsOn && found != streams_.end()) {
            child.held.push_back(found->second);
        }
    }
    const ProcessHandle process{++lastToken_};
    children_.emplace(process, std::move(child));
    const auto id = static_cast<std::uint32_t>(lastToken_);
    information = {process, ProcessHandle::none, id, id};
    return kSuccess;
}

Status MemoryProcessHost::waitProcess(ProcessHandle process, std::uint32_t milliseconds) {
    const auto found = children_.find(process);
    if (found == children_.end()) {
        return kInvalidHandle;
    }
    Child& child = found->second;
    if (child.runsOn && milliseconds != kInfiniteWait) {
        return kWaitTimedOut;
    }
    child.runsOn = false;
    child.held.clear();
    return kSuccess;
}

Status MemoryProcessHost::exitCode(ProcessHandle process, std::uint32_t& code) {
    const auto found = children_.find(process);
    if (found == children_.end()) {
        return kInvalidHandle;
    }
    code = found->second.runsOn ? kExitCodeRunning : found->second.exitCode;
    return kSuccess;
}

Status MemoryProcessHost::closeProcess(ProcessHandle process) {
    return children_.erase(process) != 0 ? kSuccess : kInvalidHandle;
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
