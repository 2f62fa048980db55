#include "install/platform/embedded/store_directory.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/file.h>
#include <sys/random.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <fstream>
#include <string_view>
#include <vector>

#include "install/platform/embedded/paths.h"
#include "install/platform/host_information.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kLogs[] = {"-wal", "-journal"};
constexpr std::size_t kNoiseSize = 16;  // bytes of randomness in the name of an unfinished store

std::string unfinishedPrefix() {
    return std::string(kStoreName) + '.';
}

// Also the name of a file that SQLite keeps next to such a store.
bool isUnfinishedStore(std::string_view name) {
    const std::string prefix = unfinishedPrefix();
    if (!name.starts_with(prefix)) {
        return false;
    }
    name.remove_prefix(prefix.size());
    const std::size_t end = name.find_first_not_of("0123456789abcdef");
    return (end == std::string_view::npos ? name.size() : end) == 2 * kNoiseSize &&
           (end == std::string_view::npos || name[end] == '-');
}

int syncFolder(const std::string& path) {
    const OwnedDescriptor folder(open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    // A directory that may be written but not read cannot be synced; that does not prevent its use.
    const bool done = folder ? fsync(folder.get()) == 0 : errno == EACCES;
    return done ? 0 : errno;
}

int makeOne(const std::string& path) {
    if (mkdir(path.c_str(), 0700) == 0) {
        const std::size_t cut = path.find_last_of('/');
        return syncFolder(cut == std::string::npos ? "." : path.substr(0, cut + 1));
    }
    const int error = errno;
    struct stat found {};
    if (stat(path.c_str(), &found) != 0) {
        return error == EEXIST ? errno : error;
    }
    return S_ISDIR(found.st_mode) ? 0 : ENOTDIR;
}

constexpr std::string_view kMovedTo = "The store is moved to ";

// The name that an interrupted replacement has given the store, or nothing.
std::string movedTo(const std::string& directory) {
    struct stat found {};
    const std::string store = directory + '/' + kStoreName;
    if (stat(store.c_str(), &found) != 0 || !S_ISREG(found.st_mode) || found.st_size >= kSmallestStore) {
        return {};
    }
    std::string line;
    std::getline(std::ifstream(store), line);
    const std::string name = line.starts_with(kMovedTo) ? line.substr(kMovedTo.size()) : "";
    return name.starts_with(kStoreName) && name.find('/') == std::string::npos ? directory + '/' + name : "";
}

// Puts a file that no program takes for a store in its place. 0 or an error number.
int putNotice(const std::string& directory, const std::string& kept) {
    std::string name;
    if (!unfinishedStoreName(name)) {
        return errno;
    }
    name = directory + '/' + name;
    const std::string text = std::string(kMovedTo) + kept.substr(directory.size() + 1) + '\n';
    const OwnedDescriptor file(open(name.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
    const bool isPut = file && inheritOwner(directory, file) && writeAll(file.get(), text).empty() &&
                       fsync(file.get()) == 0 && rename(name.c_str(), (directory + '/' + kStoreName).c_str()) == 0;
    return isPut ? 0 : errno;
}

bool exists(const std::string& path) {
    struct stat found {};
    return lstat(path.c_str(), &found) == 0;
}

bool isUsed(const std::string& path) {
    return exists(path) || std::any_of(std::begin(kLogs), std::end(kLogs),
                                       [&](std::string_view log) { return exists(path + std::string(log)); });
}

// Gives the store, but not its log, the first name that is free, and puts a notice in its place: a log that a kill
// leaves behind must not be applied to another store, nor the store be read without it. 0 or an error number.
int moveStore(const std::string& directory, const std::string& store, std::string& kept) {
    if (!isUsed(store)) {
        return 0;
    }
    std::string name = store + ".old";
    for (int number = 2; isUsed(name); ++number) {
        name = store + ".old" + std::to_string(number);
    }
    if (unlink((store + "-shm").c_str()) != 0 && errno != ENOENT) {
        return errno;
    }
    if (link(store.c_str(), name.c_str()) != 0) {
        const bool hasNoLinks = errno == EPERM || errno == EOPNOTSUPP;
        if (errno != ENOENT && (!hasNoLinks || rename(store.c_str(), name.c_str()) != 0)) {
            return errno;
        }
    }
    kept = name;
    return exists(name) ? putNotice(directory, kept) : 0;
}

}  // namespace

std::string usualStateDirectory() {
    if (std::string named = environmentText("KZ7_STATE_DIR"); !named.empty()) {
        return named;
    }
    if (geteuid() == 0) {
        return kMachineStateDirectory;
    }
    // A relative directory would be another one, with other programs, wherever the caller happens to be.
    if (const std::string state = environmentText("XDG_STATE_HOME"); state.starts_with('/')) {
        return state + "/kz7";
    }
    const std::string home = environmentText("HOME");
    return home.starts_with('/') ? home + "/.local/state/kz7" : std::string{};
}

int makeFolder(const std::string& path) {
    for (std::size_t end = path.find_first_not_of('/'); end != std::string::npos;) {
        end = path.find('/', end);
        if (const int error = makeOne(path.substr(0, end)); error != 0) {
            return error;
        }
        end = end == std::string::npos ? end : path.find_first_not_of('/', end);
    }
    return 0;
}

int lockFolder(const std::string& path, int milliseconds, OwnedDescriptor& folder) {
    using Clock = std::chrono::steady_clock;
    const auto deadline = Clock::now() + std::chrono::milliseconds(milliseconds);
    OwnedDescriptor opened(open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    while (!opened || flock(opened.get(), LOCK_EX | LOCK_NB) != 0) {
        if (!opened || errno != EWOULDBLOCK || Clock::now() > deadline) {
            return errno;
        }
        poll(nullptr, 0, 1);
    }
    folder = std::move(opened);
    return 0;
}

bool randomName(const std::string& prefix, std::string& name) {
    std::array<unsigned char, kNoiseSize> noise{};
    if (getrandom(noise.data(), noise.size(), 0) != static_cast<ssize_t>(noise.size())) {
        return false;
    }
    name = prefix;
    for (const unsigned char byte : noise) {
        appendHex(byte, 2, name);
    }
    return true;
}

bool unfinishedStoreName(std::string& name) {
    return randomName(unfinishedPrefix(), name);
}

bool inheritOwner(const std::string& directory, const OwnedDescriptor& file) {
    struct stat before {};
    const bool isThere = lstat((directory + '/' + kStoreName).c_str(), &before) == 0 && S_ISREG(before.st_mode);
    if (!isThere && stat(directory.c_str(), &before) != 0) {
        return false;
    }
    const bool isOwned = geteuid() != 0 || fchown(file.get(), before.st_uid, before.st_gid) == 0;
    return isOwned && (!isThere || fchmod(file.get(), before.st_mode & 0777) == 0);
}

int setAside(const std::string& directory, std::string& kept) {
    const std::string store = directory + '/' + kStoreName;
    kept = movedTo(directory);
    int error = kept.empty() ? moveStore(directory, store, kept) : 0;
    for (const std::string_view log : kLogs) {
        const std::string path = store + std::string(log);
        if (error == 0 && !kept.empty() && rename(path.c_str(), (kept + std::string(log)).c_str()) != 0 &&
            errno != ENOENT) {
            error = errno;
        }
    }
    if (error != 0) {
        takeBack(directory, kept);
    }
    return error;
}

void takeBack(const std::string& directory, std::string& kept) {
    if (kept.empty()) {
        return;
    }
    const std::string store = directory + '/' + kStoreName;
    for (const std::string_view log : kLogs) {
        rename((kept + std::string(log)).c_str(), (store + std::string(log)).c_str());
    }
    // This does nothing to two names of one file.
    if (rename(kept.c_str(), store.c_str()) == 0) {
        unlink(kept.c_str());
    }
    kept.clear();
}

void removeUnfinishedStores(const std::string& path) {
    const std::string folder = path + '/';
    std::vector<std::string> names;
    namesIn(folder, names);
    for (const std::string& name : names) {
        if (isUnfinishedStore(name)) {
            unlink((folder + name).c_str());
        }
    }
}

}  // namespace kz7
