// A private copy of a store, for reading if SQLite cannot create its shared-memory file next to the original. The copy
// exists as long as the object.
#pragma once

#include <string>
#include <vector>

namespace kz7 {

// The copy lasts as long as the object.
class StoreCopy {
public:
    StoreCopy() = default;
    StoreCopy(const StoreCopy&) = delete;
    StoreCopy& operator=(const StoreCopy&) = delete;
    ~StoreCopy();

    // Copies a store and its log, as they are at one moment, to a new directory below $TMPDIR or /tmp. 0 or an error
    // number; EAGAIN: other programs kept changing the files.
    int make(const std::string& store);

    std::string path() const { return folder_ + "/copy"; }

private:
    std::string folder_;
    std::vector<std::string>
        files_;  // that SQLite may have made too; known before, so that removing them needs no memory
};

}  // namespace kz7
