// Libraries for tests: entry points of this program under the path and the name they are to be found by.
#pragma once

#include <map>
#include <string>

#include "install/platform/library_loader.h"

namespace kz7 {

class MemoryLibraryLoader final : public ILibraryLoader {
public:
    using Entries = std::map<std::string, LibraryFunction>;

    Status load(std::string_view path, LibraryHandle& library) override {
        const auto found = libraries.find(std::string(path));
        if (found == libraries.end()) {
            return kModuleNotFound;
        }
        library = static_cast<LibraryHandle>(++last_);
        loaded.emplace(library, &found->second);
        return kSuccess;
    }
    Status resolve(LibraryHandle library, std::string_view name, LibraryFunction& function) override {
        const auto open = loaded.find(library);
        if (open == loaded.end()) {
            return kInvalidHandle;
        }
        const auto entry = open->second->find(std::string(name));
        if (entry == open->second->end()) {
            return kProcedureNotFound;
        }
        function = entry->second;
        return kSuccess;
    }
    Status free(LibraryHandle library) override { return loaded.erase(library) == 1 ? kSuccess : kInvalidHandle; }

    std::map<std::string, Entries> libraries;        // by path
    std::map<LibraryHandle, const Entries*> loaded;  // and not freed yet

private:
    std::uint64_t last_ = 0;
};

}  // namespace kz7
