#include "install/platform/embedded/store_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <memory>

#include "install/platform/embedded/store_copy.h"

namespace kz7 {
namespace {

constexpr int kBusyTimeout = 5000;  // milliseconds that a run waits for another writer
constexpr std::int64_t kSchemaVersion = 1;
constexpr std::size_t kLongestDirectory = 440;  // bytes; SQLite accepts 512 including the names of the files in it

// The first spelling of a name is stored next to its upper-cased form, which is used for lookups and order. The roots
// are rows 1 and 2. Ids are never reused, so that a handle of a key that another process deleted never refers to a
// later key.
constexpr const char* kSchema =
    "CREATE TABLE key (id INTEGER PRIMARY KEY AUTOINCREMENT, parent INTEGER NOT NULL, fold TEXT NOT NULL,"
    " name TEXT NOT NULL, class TEXT NOT NULL, UNIQUE (parent, fold));"
    "CREATE TABLE value (key INTEGER NOT NULL, place INTEGER NOT NULL, fold TEXT NOT NULL, name TEXT NOT NULL,"
    " type INTEGER NOT NULL, data BLOB NOT NULL, PRIMARY KEY (key, place), UNIQUE (key, fold)) WITHOUT ROWID;"
    "INSERT INTO key (id, parent, fold, name, class) VALUES (1, 0, 'HKEY_LOCAL_MACHINE', 'HKEY_LOCAL_MACHINE', ''),"
    " (2, 0, 'HKEY_USERS', 'HKEY_USERS', '');"
    "PRAGMA user_version = 1;";

// What SQLite cannot know: that the keys are a tree and are found by their names.
constexpr const char* kExamination =
    "SELECT 'a root is missing' WHERE (SELECT count(*) FROM key WHERE id IN (1, 2) AND parent = 0) <> 2"
    " UNION ALL SELECT 'no parent of key ' || id FROM key WHERE id > 2 AND parent NOT IN (SELECT id FROM key)"
    " UNION ALL SELECT 'wrong name of key ' || id FROM key WHERE fold <> upper(name)"
    " UNION ALL SELECT 'wrong name of a value of key ' || key FROM value WHERE fold <> upper(name)"
    " UNION ALL SELECT 'values of no key ' || key FROM value WHERE key NOT IN (SELECT id FROM key) LIMIT 10";

// SQLite's own file system, except that names are used unchanged. SQLite's resolves links and so would replace the
// short name of a directory by the long one.
const char* fileSystemOfGivenNames() {
    static sqlite3_vfs system = [] {
        const sqlite3_vfs* const usual = sqlite3_vfs_find(nullptr);
        sqlite3_vfs copy = usual == nullptr ? sqlite3_vfs{} : *usual;
        copy.zName = "kz7";
        copy.xFullPathname = [](sqlite3_vfs*, const char* name, int size, char* room) {
            sqlite3_snprintf(size, room, "%s", name);
            return SQLITE_OK;
        };
        return copy;
    }();
    static const bool known = system.xOpen != nullptr && sqlite3_vfs_register(&system, 0) == SQLITE_OK;
    return known ? system.zName : nullptr;
}

// The error number of a failure, or 0. SQLite returns it for calls that open and read, but stores that
// of a failed sync with the file.
int systemError(sqlite3* connection) {
    int error = connection == nullptr ? 0 : sqlite3_system_errno(connection);
    for (const int which : {SQLITE_FCNTL_JOURNAL_POINTER, SQLITE_FCNTL_FILE_POINTER}) {
        sqlite3_file* file = nullptr;
        if (error == 0 && connection != nullptr &&
            sqlite3_file_control(connection, "main", which, &file) == SQLITE_OK && file != nullptr &&
            file->pMethods != nullptr) {
            file->pMethods->xFileControl(file, SQLITE_FCNTL_LAST_ERRNO, &error);
        }
    }
    return error;
}

bool isTooLong(const std::string& directory) {
    const std::unique_ptr<char, void (*)(void*)> resolved(realpath(directory.c_str(), nullptr), std::free);
    return directory.size() > kLongestDirectory ||
           (resolved != nullptr && std::strlen(resolved.get()) > kLongestDirectory);
}

// Whether a file is a store with a log, or such a log.
bool hasLog(std::string path) {
    for (const std::string_view suffix : {"-wal", "-shm"}) {
        path.resize(path.size() - (path.ends_with(suffix) ? suffix.size() : 0));
    }
    return access((path + "-wal").c_str(), F_OK) == 0;
}

bool isRegular(const std::string& path) {
    struct stat found {};
    return stat(path.c_str(), &found) == 0 && S_ISREG(found.st_mode);
}

// One of the files that SQLite keeps next to a store, if it is there and is not a file: SQLite would wait for the
// writer of a pipe. Empty otherwise.
std::string irregularNeighbour(const std::string& store) {
    std::error_code missing;
    const std::string target = std::filesystem::canonical(store, missing).string();
    for (const char* suffix : {"-journal", "-wal", "-shm"}) {
        std::string neighbour = (missing ? store : target) + suffix;
        struct stat found {};
        if (lstat(neighbour.c_str(), &found) == 0 && !S_ISREG(found.st_mode)) {
            return neighbour;
        }
    }
    return {};
}

}  // namespace

StoreFile::StoreFile(std::string directory, const StoreReading& reading)
    : directory_(std::move(directory)),
      path_(reading.backup.empty() ? directory_ + '/' + kStoreName : reading.backup),
      reading_(reading) {}

bool StoreFile::exists() const {
    // Only a definite "does not exist" counts; a directory that may not be searched makes the open fail.
    return access(path_.c_str(), F_OK) == 0 || (errno != ENOENT && errno != ENOTDIR);
}

bool StoreFile::isPart(const std::string& path) const {
    namespace fs = std::filesystem;
    std::error_code ignored;
    const fs::path asked = fs::absolute(path, ignored);
    // If the store is a link, the other files are next to its target.
    for (const fs::path& store : {fs::path(path_), fs::weakly_canonical(path_, ignored)}) {
        const std::string name = store.filename().string();
        const std::string other = asked.filename().string();
        if ((other == name || other.starts_with(name + '-')) &&
            fs::equivalent(asked.parent_path(), store.parent_path(), ignored)) {
            return true;
        }
    }
    return hasLog(asked.string());
}

StoreFault StoreFile::refused(Status status, const std::string& file, int error) const {
    if (error == EACCES || error == EPERM || error == EROFS) {
        status = kAccessDenied;
    } else if (error == ENOSPC || error == EDQUOT || error == EFBIG) {
        status = kDiskFull;
    }
    return {status, file, std::strerror(error)};
}

StoreFault StoreFile::stayedLocked() const {
    return {kBusy, path_, "stayed locked by another program for 5 seconds"};
}

StoreFault StoreFile::openForWriting(Connection& connection) {
    if (reading_.inMemory) {
        return openEmpty(connection);
    }
    if (!exists()) {
        if (StoreFault fault = make(); fault.status != kSuccess) {
            return fault;
        }
    }
    return open(SQLITE_OPEN_READWRITE, connection);
}

StoreFault StoreFile::openForReading(Connection& connection) {
    if (!reading_.backup.empty()) {
        return openCopy(connection);
    }
    StoreFault fault = checkDirectory();
    const bool isMissing = !directory_.empty() && access(directory_.c_str(), F_OK) != 0 && errno == ENOENT;
    if (isMissing && reading_.missingIsEmpty) {
        return openEmpty(connection);
    }
    if (fault.status != kSuccess || !exists()) {
        return fault.status != kSuccess ? fault : openEmpty(connection);
    }
    fault = open(SQLITE_OPEN_READONLY, connection);
    // A log is read through a shared-memory file, which cannot always be created.
    const bool refused = fault.status == kCannotOpen || fault.status == kAccessDenied;
    const bool canCopy = isRegular(path_) && access(path_.c_str(), R_OK) == 0 && irregularNeighbour(path_).empty();
    return refused && canCopy ? openCopy(connection) : fault;
}

StoreFault StoreFile::checkDirectory() const {
    if (directory_.empty()) {
        return {kCannotOpen, "state directory", "neither KZ7_STATE_DIR nor HOME is set"};
    }
    struct stat found {};
    if (stat(directory_.c_str(), &found) != 0) {
        return refused(kCannotOpen, directory_, errno);
    }
    return S_ISDIR(found.st_mode) ? StoreFault{} : refused(kCannotOpen, directory_, ENOTDIR);
}

// Into memory, so that the files of the copy can be deleted at once.
StoreFault StoreFile::openCopy(Connection& connection) const {
    StoreCopy copy;
    if (const int error = copy.make(path_); error != 0) {
        return refused(kCannotOpen, path_ + ": cannot make a private copy", error);
    }
    sqlite3* opened = nullptr;
    int result = sqlite3_open_v2(copy.path().c_str(), &opened, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX, nullptr);
    const Connection source(opened);
    if (StoreFault fault = checkVersion(opened, result); fault.status != kSuccess) {
        return fault;
    }
    result = copyToMemory(opened, connection);
    return result == SQLITE_OK ? StoreFault{} : explain(opened, result);
}

// Several processes may create the store at once: one of them holds the lock of the directory and builds the store
// under another name, the others find it finished. A killed process leaves at most a file that the next one removes.
// (Switching a shared new file to a write-ahead log fails regardless of the busy timeout.)
StoreFault StoreFile::make() {
    OwnedDescriptor folder;
    StoreFault fault = lock(folder);
    // If the name exists, even as a link without a target, the open decides.
    struct stat found {};
    if (fault.status != kSuccess || lstat(path_.c_str(), &found) == 0) {
        return fault;
    }
    std::string kept;
    return put(folder, nullptr, kept);
}

StoreFault StoreFile::lock(OwnedDescriptor& folder) const {
    if (directory_.empty()) {
        return checkDirectory();
    }
    if (const int error = makeFolder(directory_); error != 0) {
        return refused(kCannotOpen, directory_, error);
    }
    const int error = lockFolder(directory_, kBusyTimeout, folder);
    if (error == EWOULDBLOCK) {
        return stayedLocked();
    }
    return error == 0 ? StoreFault{} : refused(kCannotOpen, directory_, error);
}

StoreFault StoreFile::replace(sqlite3* content, std::string& kept) {
    OwnedDescriptor folder;
    OwnedDescriptor store;
    StoreFault fault = lock(folder);
    if (fault.status == kSuccess && isWhole()) {
        return {kBusy, path_, "was replaced by another program"};
    }
    fault = fault.status == kSuccess ? lockOut(store) : fault;
    return fault.status == kSuccess ? put(folder, content, kept) : fault;
}

// Two programs may have found the same damage; the second must not replace what the first has made.
bool StoreFile::isWhole() {
    Connection connection;
    std::vector<std::string> damages;
    return exists() && open(SQLITE_OPEN_READONLY, connection).status == kSuccess &&
           examine(connection.get(), damages) == SQLITE_OK && damages.empty();
}

// SQLite holds a lock of a store in use. One that opened the store before and reads it later finds that it has moved.
StoreFault StoreFile::lockOut(OwnedDescriptor& store) const {
    OwnedDescriptor opened(::open(path_.c_str(), O_RDWR | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC));
    struct stat found {};
    if (!opened && errno == ENOENT) {
        return {};
    }
    if (!opened || fstat(opened.get(), &found) != 0) {
        return refused(kCannotOpen, path_, errno);
    }
    struct flock whole {};
    whole.l_type = F_WRLCK;
    if (!S_ISREG(found.st_mode)) {
        return {kCannotOpen, path_, "is not a regular file"};
    }
    if (fcntl(opened.get(), F_OFD_SETLK, &whole) != 0) {
        return errno == EAGAIN || errno == EACCES ? StoreFault{kBusy, path_, "is in use by another program"}
                                                  : refused(kCannotOpen, path_, errno);
    }
    store = std::move(opened);
    return {};
}

StoreFault StoreFile::put(const OwnedDescriptor& folder, sqlite3* content, std::string& kept) {
    removeUnfinishedStores(directory_);
    StoreFault fault = build(folder, content, kept);
    if (fault.status != kSuccess) {
        removeUnfinishedStores(directory_);
    }
    return fault;
}

StoreFault StoreFile::build(const OwnedDescriptor& folder, sqlite3* content, std::string& kept) {
    std::string name;
    if (!unfinishedStoreName(name)) {
        return refused(kCannotOpen, path_, errno);
    }
    // Stays open: closing it earlier would drop SQLite's locks on the file.
    const OwnedDescriptor file(
        openat(folder.get(), name.c_str(), O_CREAT | O_EXCL | O_RDWR | O_NOFOLLOW | O_CLOEXEC, 0600));
    if (!file) {
        return refused(kCannotOpen, directory_ + '/' + name, errno);
    }
    if (!inheritOwner(directory_, file)) {
        return refused(kCannotOpen, directory_ + '/' + name, errno);
    }
    if (StoreFault fault = fill(name, content); fault.status != kSuccess) {
        return fault;
    }
    // The lock makes this safe on file systems without hard links and without a rename that does not replace.
    if (fsync(file.get()) != 0 || (errno = setAside(directory_, kept)) != 0) {
        return refused(kCannotOpen, path_, errno);
    }
    if (renameat(folder.get(), name.c_str(), folder.get(), kStoreName) != 0) {
        const int error = errno;
        takeBack(directory_, kept);
        return refused(kCannotOpen, path_, error);
    }
    return fsync(folder.get()) == 0 ? StoreFault{} : refused(kCannotOpen, path_, errno);
}

// Writes a new store.
StoreFault StoreFile::fill(const std::string& name, sqlite3* content) {
    Connection connection;
    int result = connect(name, SQLITE_OPEN_READWRITE, connection);
    // The schema is written first: in rollback mode a small file is written once, and the switch then only changes its
    // header.
    for (const char* sql :
         {"PRAGMA page_size = 4096; PRAGMA synchronous = OFF; BEGIN", kSchema, kHistoryTables, "COMMIT"}) {
        result = result == SQLITE_OK ? execute(connection.get(), sql) : result;
    }
    if (result == SQLITE_OK && content != nullptr) {
        result = copyDatabase(content, connection.get());
    }
    result = result == SQLITE_OK ? execute(connection.get(), "PRAGMA journal_mode = WAL") : result;
    return result == SQLITE_OK ? StoreFault{} : explain(connection.get(), result);
}

int StoreFile::connect(const std::string& name, int flags, Connection& connection) {
    // Statistics would take a lock at each allocation. Must precede the first use of SQLite, and fails after it.
    sqlite3_config(SQLITE_CONFIG_MEMSTATUS, 0);
    std::string path = directory_ + '/' + name;
    const char* system = nullptr;
    if (isTooLong(directory_)) {
        if (!folder_) {
            folder_.receive() = ::open(directory_.c_str(), O_PATH | O_DIRECTORY | O_CLOEXEC);
        }
        path = "/proc/self/fd/" + std::to_string(folder_.get()) + '/' + name;
        system = fileSystemOfGivenNames();
    }
    sqlite3* opened = nullptr;
    const int result = sqlite3_open_v2(path.c_str(), &opened, flags | SQLITE_OPEN_NOMUTEX, system);
    connection.reset(opened);
    return result;
}

StoreFault StoreFile::open(int flags, Connection& connection) {
    // Does not wait for the writer of a pipe.
    struct stat found {};
    if (stat(path_.c_str(), &found) == 0 && !S_ISREG(found.st_mode)) {
        return {kCannotOpen, path_, "is not a regular file"};
    }
    if (const std::string neighbour = irregularNeighbour(path_); !neighbour.empty()) {
        return {kCannotOpen, neighbour, "is not a regular file"};
    }
    // SQLite would take its pages from a log next to it.
    if (S_ISREG(found.st_mode) && found.st_size > 0 && found.st_size < kSmallestStore) {
        return {kNotRegistryFile, path_, sqlite3_errstr(SQLITE_NOTADB)};
    }
    Connection owned;
    int result = connect(kStoreName, flags, owned);
    sqlite3* const opened = owned.get();
    if (result == SQLITE_OK) {
        sqlite3_extended_result_codes(opened, 1);
        sqlite3_busy_timeout(opened, kBusyTimeout);
        // Without this each run would make a checkpoint; the registry store makes one when the log has grown.
        sqlite3_db_config(opened, SQLITE_DBCONFIG_NO_CKPT_ON_CLOSE, 1, nullptr);
        result = execute(opened, "PRAGMA synchronous = FULL; PRAGMA wal_autocheckpoint = 0");
    }
    StoreFault fault = checkVersion(opened, result);
    if (fault.status == kSuccess) {
        connection = std::move(owned);
    }
    return fault;
}

// `result` is the result of opening the connection.
StoreFault StoreFile::checkVersion(sqlite3* connection, int result) const {
    std::int64_t version = 0;
    if (result == SQLITE_OK) {
        result = queryNumber(connection, "PRAGMA user_version", version);
    }
    if (result != SQLITE_OK) {
        return explain(connection, result);
    }
    if (version > kSchemaVersion) {
        return {kRevisionMismatch, path_, "was written by a newer version of this program"};
    }
    if (version < kSchemaVersion) {
        return {kNotRegistryFile, path_, "is not a registry store"};
    }
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

int StoreFile::examine(sqlite3* connection, std::vector<std::string>& damages) {
    std::vector<std::string> lines;
    int result = queryTexts(connection, "PRAGMA integrity_check(10)", lines);
    std::erase(lines, "ok");
    for (std::string& line : lines) {
        constexpr std::string_view kHeading = "*** in database main ***\n";
        line.erase(0, line.starts_with(kHeading) ? kHeading.size() : 0);
    }
    if (result == SQLITE_OK && lines.empty()) {
        result = queryTexts(connection, kExamination, lines);
    }
    damages = std::move(lines);
    return result;
}

StoreFault StoreFile::explain(sqlite3* connection, int result) const {
    const std::string said = connection == nullptr ? sqlite3_errstr(result) : sqlite3_errmsg(connection);
    switch (result & 0xFF) {
        case SQLITE_BUSY:
        case SQLITE_LOCKED:
            return stayedLocked();
        case SQLITE_FULL:
            return {kDiskFull, path_, said};
        case SQLITE_CORRUPT:
        case SQLITE_ERROR:  // the tables are others than ours
            return {kRegistryCorrupt, path_, said};
        case SQLITE_NOTADB:
            return {kNotRegistryFile, path_, said};
        case SQLITE_NOMEM:
            return {kOutOfMemory, path_, said};
        case SQLITE_PERM:
        case SQLITE_AUTH:
        case SQLITE_READONLY:
            return {kAccessDenied, path_, said};
        default: {
            const Status status = (result & 0xFF) == SQLITE_CANTOPEN ? kCannotOpen : kRegistryIoFailed;
            const int error = systemError(connection);
            return error == 0 ? StoreFault{status, path_, said} : refused(status, path_, error);
        }
    }
}

}  // namespace kz7
