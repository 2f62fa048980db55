// A process host whose chosen call fails. The counter is for one thread: use it over the host in memory.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/process_host.h"

namespace kz7 {

class FaultyProcessHost final : public IProcessHost {
public:
    FaultyProcessHost(IProcessHost& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status getSlot(StandardSlot slot, StreamHandle& stream) override {
        return unlessFailing(faults_, "getSlot", [&] { return real_.getSlot(slot, stream); });
    }
    Status setSlot(StandardSlot slot, StreamHandle stream) override {
        return unlessFailing(faults_, "setSlot", [&] { return real_.setSlot(slot, stream); });
    }
    Status createPipe(StreamHandle& readEnd, StreamHandle& writeEnd) override {
        return unlessFailing(faults_, "createPipe", [&] { return real_.createPipe(readEnd, writeEnd); });
    }
    Status duplicate(StreamHandle stream, StreamHandle& copy) override {
        return unlessFailing(faults_, "duplicate", [&] { return real_.duplicate(stream, copy); });
    }
    Status read(StreamHandle stream, Buffer& data) override {
        return unlessFailing(faults_, "read", [&] { return real_.read(stream, data); });
    }
    Status write(StreamHandle stream, std::string_view data) override {
        return unlessFailing(faults_, "write", [&] { return real_.write(stream, data); });
    }
    Status closeStream(StreamHandle stream) override {
        return closingAnyway(faults_, "closeStream", [&] { return real_.closeStream(stream); });
    }
    Status startProcess(const ProcessStart& start, ProcessInformation& started) override {
        return unlessFailing(faults_, "startProcess", [&] { return real_.startProcess(start, started); });
    }
    Status waitProcess(ProcessHandle process, std::uint32_t milliseconds) override {
        return unlessFailing(faults_, "waitProcess", [&] { return real_.waitProcess(process, milliseconds); });
    }
    Status exitCode(ProcessHandle process, std::uint32_t& code) override {
        return unlessFailing(faults_, "exitCode", [&] { return real_.exitCode(process, code); });
    }
    Status closeProcess(ProcessHandle process) override {
        return closingAnyway(faults_, "closeProcess", [&] { return real_.closeProcess(process); });
    }
    Status shortPath(std::string_view path, Buffer& shortened) override {
        return unlessFailing(faults_, "shortPath", [&] { return real_.shortPath(path, shortened); });
    }

private:
    IProcessHost& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
