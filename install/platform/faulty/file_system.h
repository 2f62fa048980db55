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
    Status readFile(std::string_view path, std::string& content) override {
        return unlessFailing(faults_, "readFile", [&] { return real_.readFile(path, content); });
    }
    Status openForAppend(std::string_view path, FileHandle& file) override {
        return unlessFailing(faults_, "openForAppend", [&] { return real_.openForAppend(path, file); });
    }
    Status write(FileHandle file, std::string_view data, std::uint32_t& written) override {
        written = 0;
        return unlessFailing(faults_, "write", [&] { return real_.write(file, data, written); });
    }
    Status closeFile(FileHandle file) override {
        return closingAnyway(faults_, "closeFile", [&] { return real_.closeFile(file); });
    }
    Status findFile(std::string_view pattern, std::string& name) override {
        return unlessFailing(faults_, "findFile", [&] { return real_.findFile(pattern, name); });
    }
    Status productPath(std::string_view hostPath, std::string& path) override {
        return unlessFailing(faults_, "productPath", [&] { return real_.productPath(hostPath, path); });
    }
    std::string shownPath(std::string_view path) override { return real_.shownPath(path); }

private:
    IFileSystem& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
