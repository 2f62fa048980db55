// A library loader whose chosen call fails.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/library_loader.h"

namespace kz7 {

class FaultyLibraryLoader final : public ILibraryLoader {
public:
    FaultyLibraryLoader(ILibraryLoader& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status load(std::string_view path, LibraryHandle& library) override {
        return unlessFailing(faults_, "load", [&] { return real_.load(path, library); });
    }
    Status resolve(LibraryHandle library, std::string_view name, LibraryFunction& function) override {
        return unlessFailing(faults_, "resolve", [&] { return real_.resolve(library, name, function); });
    }
    Status free(LibraryHandle library) override {
        return closingAnyway(faults_, "free", [&] { return real_.free(library); });
    }

private:
    ILibraryLoader& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
