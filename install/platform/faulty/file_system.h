// A file system whose chosen call fails.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/file_system.h"

namespace kz7 {

class FaultyFileSystem final : public IFileSystem {
public:
    FaultyFileSystem(IFileSystem& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status probe(std::string_view path) override {
        return unlessFailing(faults_, "probe", [&] { return real_.probe(path); });
    }

private:
    IFileSystem& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
