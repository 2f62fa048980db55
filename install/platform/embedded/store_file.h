// The file of the embedded registry store: where it lies, how the first of several processes makes it, and
// how every later one opens it.
#pragma once

#include <string>

#include "install/platform/embedded/database.h"
#include "install/platform/embedded/store_directory.h"
#include "install/platform/status.h"

namespace kz7 {

struct StoreFault {
    Status status = kSuccess;
    std::string file;    // what could not be used
    std::string reason;  // why, for people
};

// How a store is read.
struct StoreReading {
    std::string backup;           // a file that is read instead of the store
    bool missingIsEmpty = false;  // a state directory that does not exist reads as empty
};

class StoreFile {
public:
    StoreFile(std::string directory, const StoreReading& reading);

    const std::string& path() const { return path_; }
    bool exists() const;

    // Whether a host path names the store, its log or another file that SQLite keeps next to it; or one of another
    // store that has a log: the log would be read into whatever took its store's place.
    bool isPart(const std::string& path) const;

    // Makes the state directory (mode 0700) and the store when they are missing, and opens it as a writer.
    StoreFault openForWriting(Connection& connection);

    // Opens the store for reading, also where this process may not write; one in an existing directory that has none
    // reads as empty. A connection must be closed before this object goes.
    StoreFault openForReading(Connection& connection);

    // What a failed SQLite call on this store means.
    StoreFault explain(sqlite3* connection, int result) const;

private:
    StoreFault checkDirectory() const;
    StoreFault open(int flags, Connection& connection);
    StoreFault openCopy(Connection& connection) const;
    StoreFault openEmpty(Connection& connection) const;
    StoreFault checkVersion(sqlite3* connection, int result) const;
    StoreFault make();
    StoreFault build(const OwnedDescriptor& folder);
    // Opens the file of that name in the state directory; the connection is there on failure too, for its message.
    int connect(const std::string& name, int flags, Connection& connection);
    StoreFault refused(Status status, const std::string& file, int error) const;
    StoreFault stayedLocked() const;

    std::string directory_;
    std::string path_;
    StoreReading reading_;
    OwnedDescriptor folder_;  // the state directory, where its path is too long for SQLite
};

}  // namespace kz7
