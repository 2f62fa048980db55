#include "install/platform/embedded/store_file.h"

#include <fcntl.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>

namespace kz7 {
namespace {

constexpr int kBusyTimeout = 5000;  // milliseconds that a run waits for another writer
constexpr std::int64_t kSchemaVersion = 1;

// Names are kept as they were first written beside their upper-cased form, which is what they are found and
// ordered by. The roots are rows 1 and 2. Ids are never used again, so that a handle that another process's
// delete has emptied never comes to mean a later key.
constexpr const char* kSchema =
    "CREATE TABLE key (id INTEGER PRIMARY KEY AUTOINCREMENT, parent INTEGER NOT NULL, fold TEXT NOT NULL,"
    " name TEXT NOT NULL, class TEXT NOT NULL, UNIQUE (parent, fold));"
    "CREATE TABLE value (key INTEGER NOT NULL, place INTEGER NOT NULL, fold TEXT NOT NULL, name TEXT NOT NULL,"
    " type INTEGER NOT NULL, data BLOB NOT NULL, PRIMARY KEY (key, place), UNIQUE (key, fold)) WITHOUT ROWID;"
    "INSERT INTO key (id, parent, fold, name, class) VALUES (1, 0, 'HKEY_LOCAL_MACHINE', 'HKEY_LOCAL_MACHINE', ''),"
    " (2, 0, 'HKEY_USERS', 'HKEY_USERS', '');"
    "PRAGMA user_version = 1;";

std::string environment(const char* name) {
    const char* value = std::getenv(name);
    return value == nullptr ? std::string{} : value;
}

// A suffix that nobody can guess.
bool randomSuffix(std::string& suffix) {
    std::array<unsigned char, 16> noise{};
    if (getrandom(noise.data(), noise.size(), 0) != static_cast<ssize_t>(noise.size())) {
        return false;
    }
    static constexpr char kDigits[] = "0123456789abcdef";
    suffix.clear();
    for (const unsigned char byte : noise) {
        suffix += kDigits[byte >> 4];
        suffix += kDigits[byte & 15];
    }
    return true;
}

int syncFile(const std::string& path, int flags) {
    const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC | flags);
    if (file < 0) {
        return errno;
    }
    const int error = fsync(file) == 0 ? 0 : errno;
    close(file);
    return error;
}

}  // namespace

int makeFolder(const std::string& path) {
    if (mkdir(path.c_str(), 0700) == 0) {
        return 0;
    }
    if (errno == ENOENT) {
        const std::size_t cut = path.find_last_of('/');
        if (cut != std::string::npos && cut != 0) {
            if (const int error = makeFolder(path.substr(0, cut)); error != 0) {
                return error;
            }
            return mkdir(path.c_str(), 0700) == 0 || errno == EEXIST ? 0 : errno;
        }
        return ENOENT;
    }
    if (errno != EEXIST) {
        return errno;
    }
    struct stat found {};
    if (stat(path.c_str(), &found) != 0) {
        return errno;
    }
    return S_ISDIR(found.st_mode) ? 0 : ENOTDIR;
}

std::string usualStateDirectory() {
    if (std::string named = environment("KZ7_STATE_DIR"); !named.empty()) {
        return named;
    }
    if (geteuid() == 0) {
        return kMachineStateDirectory;
    }
    if (const std::string state = environment("XDG_STATE_HOME"); !state.empty()) {
        return state + "/kz7";
    }
    const std::string home = environment("HOME");
    return home.empty() ? std::string{} : home + "/.local/state/kz7";
}

StoreFile::StoreFile(std::string directory) : directory_(std::move(directory)), path_(directory_ + "/registry.db") {}

bool StoreFile::exists() const {
    // Only a definite "not there" is one: a folder that may not be searched is an error of the open.
    return access(path_.c_str(), F_OK) == 0 || (errno != ENOENT && errno != ENOTDIR);
}

StoreFault StoreFile::refused(Status status, const std::string& file, int error) const {
    if (error == EACCES || error == EPERM || error == EROFS) {
        status = kAccessDenied;
    } else if (error == ENOSPC || error == EDQUOT || error == EFBIG) {
        status = kDiskFull;
    }
    return {status, file, std::strerror(error)};
}

StoreFault StoreFile::openForWriting(Connection& connection) const {
    if (!exists()) {
        if (StoreFault fault = make(); fault.status != kSuccess) {
            return fault;
        }
    }
    return open(connection);
}

// Several processes may make the store at once. Each builds its own under a name of its own and links it
// into place; the first link wins and everybody opens that one. (Switching a shared new file to a
// write-ahead log instead fails whatever the busy timeout.)
StoreFault StoreFile::make() const {
    if (directory_.empty()) {
        return {kCannotOpen, "state directory", "neither KZ7_STATE_DIR nor HOME is set"};
    }
    if (const int error = makeFolder(directory_); error != 0) {
        return refused(kCannotOpen, directory_, error);
    }
    std::string suffix;
    if (!randomSuffix(suffix)) {
        return refused(kCannotOpen, path_, errno);
    }
    const std::string temporary = path_ + "." + suffix;
    StoreFault fault = build(temporary);
    if (fault.status == kSuccess) {
        int error = syncFile(temporary, 0);
        if (error == 0 && link(temporary.c_str(), path_.c_str()) != 0 && errno != EEXIST) {
            error = errno;
        }
        if (error == 0) {
            error = syncFile(directory_, O_DIRECTORY);
        }
        if (error != 0) {
            fault = refused(kCannotOpen, path_, error);
        }
    }
    for (const char* end : {"", "-wal", "-shm", "-journal"}) {
        unlink((temporary + end).c_str());
    }
    return fault;
}

StoreFault StoreFile::build(const std::string& path) const {
    const int file = ::open(path.c_str(), O_CREAT | O_EXCL | O_RDWR | O_CLOEXEC, 0600);
    if (file < 0) {
        return refused(kCannotOpen, path, errno);
    }
    close(file);
    sqlite3* opened = nullptr;
    int result = sqlite3_open_v2(path.c_str(), &opened, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX, nullptr);
    const Connection connection(opened);
    // The schema first: a small file in rollback mode is written once, the switch then only marks its header.
    for (const char* sql :
         {"PRAGMA page_size = 4096; PRAGMA synchronous = OFF; BEGIN", kSchema, "COMMIT", "PRAGMA journal_mode = WAL"}) {
        if (result == SQLITE_OK) {
            result = execute(opened, sql);
        }
    }
    return result == SQLITE_OK ? StoreFault{} : explain(opened, result);
}

StoreFault StoreFile::open(Connection& connection) const {
    sqlite3* opened = nullptr;
    int result = sqlite3_open_v2(path_.c_str(), &opened, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX, nullptr);
    Connection owned(opened);
    std::int64_t version = 0;
    if (result == SQLITE_OK) {
        sqlite3_extended_result_codes(opened, 1);
        sqlite3_busy_timeout(opened, kBusyTimeout);
        // Each run would else pay for a checkpoint; the registry store makes one when the log has grown.
        sqlite3_db_config(opened, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
        result = execute(opened, "PRAGMA synchronous = FULL; PRAGMA wal_autocheckpoint = 0");
    }
    if (result == SQLITE_OK) {
        result = queryNumber(opened, "PRAGMA user_version", version);
    }
    if (result != SQLITE_OK) {
        return explain(opened, result);
    }
    if (version > kSchemaVersion) {
        return {kRevisionMismatch, path_, "was written by a newer version of this program"};
    }
    if (version < kSchemaVersion) {
        return {kNotRegistryFile, path_, "is not a registry store"};
    }
    connection = std::move(owned);
    return {};
}

StoreFault StoreFile::openEmpty(Connection& connection) const {
    sqlite3* opened = nullptr;
    int result = sqlite3_open_v2(":memory:", &opened, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX, nullptr);
    Connection owned(opened);
    if (result == SQLITE_OK) {
        result = execute(opened, kSchema);
    }
    if (result != SQLITE_OK) {
        return explain(opened, result);
    }
    connection = std::move(owned);
    return {};
}

StoreFault StoreFile::explain(sqlite3* connection, int result) const {
    const std::string said = connection == nullptr ? sqlite3_errstr(result) : sqlite3_errmsg(connection);
    switch (result & 0xFF) {
        case SQLITE_BUSY:
        case SQLITE_LOCKED:
            return {kBusy, path_, "stayed locked by another program for 5 seconds"};
        case SQLITE_FULL:
            return {kDiskFull, path_, said};
        case SQLITE_CORRUPT:
            return {kRegistryCorrupt, path_, said};
        case SQLITE_NOTADB:
            return {kNotRegistryFile, path_, said};
        case SQLITE_NOMEM:
            return {kOutOfMemory, path_, said};
        case SQLITE_PERM:
        case SQLITE_AUTH:
        case SQLITE_READONLY:
            return {kAccessDenied, path_, said};
        case SQLITE_CANTOPEN: {
            const int error = connection == nullptr ? 0 : sqlite3_system_errno(connection);
            return error == 0 ? StoreFault{kCannotOpen, path_, said} : refused(kCannotOpen, path_, error);
        }
        default: {
            const int error = connection == nullptr ? 0 : sqlite3_system_errno(connection);
            return error == 0 ? StoreFault{kRegistryIoFailed, path_, said} : refused(kRegistryIoFailed, path_, error);
        }
    }
}

}  // namespace kz7
