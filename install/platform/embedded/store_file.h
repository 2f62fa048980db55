// The file of the embedded registry store: its place, how the first of several processes creates it and how later ones
// open it.
#pragma once

#include <string>

#include "install/platform/embedded/database.h"
#include "install/platform/embedded/store_directory.h"
#include "install/platform/status.h"

namespace kz7 {

struct StoreFault {
    Status status = kSuccess;
    std::string file;    // the file that could not be used
    std::string reason;  // why, for people
};

// How a store is read.
struct StoreReading {
    std::string backup = {};      // a file that is read instead of the store
    bool missingIsEmpty = false;  // a state directory that does not exist reads as empty
    bool inMemory = false;        // no file: an empty store that can be written
};

// A run's status is null until it has ended. The parts of a run are found from its first one on; `total` counts the
// bytes of all parts up to and with that one. Stores of older programs get these tables by the
// first run that is recorded, and those programs ignore them.
inline constexpr const char* kHistoryTables =
    "CREATE TABLE IF NOT EXISTS run (number INTEGER PRIMARY KEY AUTOINCREMENT, parent INTEGER NOT NULL,"
    " undoes INTEGER NOT NULL, begun INTEGER NOT NULL, ended INTEGER NOT NULL, status INTEGER, user TEXT NOT NULL,"
    " host TEXT NOT NULL, program TEXT NOT NULL, arguments TEXT NOT NULL, outside TEXT NOT NULL,"
    " nvalues INTEGER NOT NULL, nkeys INTEGER NOT NULL, nservices INTEGER NOT NULL, firstpart INTEGER NOT NULL);"
    "CREATE TABLE IF NOT EXISTS runpart (id INTEGER PRIMARY KEY, run INTEGER NOT NULL, total INTEGER NOT NULL,"
    " changes BLOB NOT NULL)";

class StoreFile {
public:
    StoreFile(std::string directory, const StoreReading& reading);

    const std::string& path() const { return path_; }
    bool exists() const;

    // Whether a host path names the store, its log or another file that SQLite keeps next to it, or such a file of
    // another store that has a log: that log would be applied to any file that replaces its store.
    bool isPart(const std::string& path) const;

    // Creates the state directory (mode 0700) and the store if they are missing, and opens the store for writing.
    StoreFault openForWriting(Connection& connection);

    // Opens the store for reading, even if this process may not write to it. A missing store in an existing directory
    // reads as empty. Close the connection before this object is destroyed.
    StoreFault openForReading(Connection& connection);

    // Puts a new store with the content of a database in the place of this one, which may be damaged or missing, and
    // sets this one aside. kBusy: another process has it open, or has replaced it. This process must not have it open.
    StoreFault replace(sqlite3* content, std::string& kept);

    // Lists up to 10 damages of an open store. SQLITE_OK, or the result of a query that failed.
    static int examine(sqlite3* connection, std::vector<std::string>& damages);

    // Describes a failed SQLite call on this store.
    StoreFault explain(sqlite3* connection, int result) const;

private:
    StoreFault checkDirectory() const;
    StoreFault open(int flags, Connection& connection);
    StoreFault openCopy(Connection& connection) const;
    StoreFault openEmpty(Connection& connection) const;
    StoreFault checkVersion(sqlite3* connection, int result) const;
    bool isWhole();
    StoreFault make();
    StoreFault lock(OwnedDescriptor& folder) const;
    StoreFault lockOut(OwnedDescriptor& store) const;
    StoreFault put(const OwnedDescriptor& folder, sqlite3* content, std::string& kept);
    StoreFault build(const OwnedDescriptor& folder, sqlite3* content, std::string& kept);
    StoreFault fill(const std::string& name, sqlite3* content);
    // Opens the file of that name in the state directory; the connection is set on failure too, for its message.
    int connect(const std::string& name, int flags, Connection& connection);
    StoreFault refused(Status status, const std::string& file, int error) const;
    StoreFault stayedLocked() const;

    std::string directory_;
    std::string path_;
    StoreReading reading_;
    OwnedDescriptor folder_;  // the state directory, if its path is too long for SQLite
};

}  // namespace kz7
