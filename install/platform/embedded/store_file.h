// The file of the embedded registry store: where it lies, how the first of several processes makes it, and
// how every later one opens it.
#pragma once

#include <string>

#include "install/platform/embedded/database.h"
#include "install/platform/status.h"

namespace kz7 {

inline constexpr const char* kMachineStateDirectory = "/var/lib/kz7";

// $KZ7_STATE_DIR; else /var/lib/kz7 for root; else $XDG_STATE_HOME/kz7 or ~/.local/state/kz7; else empty.
std::string usualStateDirectory();

// Makes a folder and its missing parents for their owner alone; 0 or the error of the call that failed.
int makeFolder(const std::string& path);

struct StoreFault {
    Status status = kSuccess;
    std::string file;    // what could not be used
    std::string reason;  // why, for people
};

class StoreFile {
public:
    explicit StoreFile(std::string directory);

    const std::string& path() const { return path_; }
    bool exists() const;

    // Makes the state directory (mode 0700) and the store when they are missing, and opens it as a writer.
    StoreFault openForWriting(Connection& connection) const;

    // Opens a store that exists.
    StoreFault open(Connection& connection) const;

    // An empty store in memory, for reading where there is none.
    StoreFault openEmpty(Connection& connection) const;

    // What a failed SQLite call on this store means.
    StoreFault explain(sqlite3* connection, int result) const;

private:
    StoreFault make() const;
    StoreFault build(const std::string& path) const;
    StoreFault refused(Status status, const std::string& file, int error) const;

    std::string directory_;
    std::string path_;
};

}  // namespace kz7
