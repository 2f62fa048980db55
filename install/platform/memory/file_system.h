// The file-system port in memory: the set of paths that exist.
#pragma once

#include <set>
#include <string>

#include "install/platform/file_system.h"

namespace kz7 {

class MemoryFileSystem final : public IFileSystem {
public:
    Status probe(std::string_view path) override;

    // Lets a file be there, and the folders above it. The path is absolute; names compare without case, as
    // the product's own paths do.
    void add(std::string_view path);

    void remove(std::string_view path);

private:
    std::set<std::string> paths_;
};

}  // namespace kz7
