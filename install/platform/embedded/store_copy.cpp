#include "install/platform/embedded/store_copy.h"

#include <fcntl.h>
#include <sys/sendfile.h>
#include <sys/stat.h>

#include <array>
#include <cerrno>
#include <cstdlib>

#include "install/platform/embedded/descriptor.h"

namespace kz7 {
namespace {

constexpr int kTries = 20;
constexpr std::size_t kMostAtOnce = 0x7FFFF000;  // bytes of one call
constexpr const char* kLogSuffix = "-wal";
constexpr const char* kSuffixes[] = {"", kLogSuffix, "-shm", "-journal"};

// Changes with every write to a file; all zero if the file does not exist.
std::array<std::int64_t, 4> stampOf(const std::string& path) {
    struct stat found {};
    return stat(path.c_str(), &found) != 0
               ? std::array<std::int64_t, 4>{}
               : std::array<std::int64_t, 4>{static_cast<std::int64_t>(found.st_ino), found.st_size,
                                             found.st_mtim.tv_sec, found.st_mtim.tv_nsec};
}

// 0 or an error number.
int copyFile(const std::string& from, const std::string& to) {
    // Does not wait for the writer of a pipe.
    const OwnedDescriptor source(open(from.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
    struct stat found {};
    if (source && fstat(source.get(), &found) == 0 && !S_ISREG(found.st_mode)) {
        return EINVAL;
    }
    const OwnedDescriptor target(source ? open(to.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_NOFOLLOW | O_CLOEXEC, 0600)
                                        : -1);
    if (!target) {
        return errno;
    }
    ssize_t count = 0;
    do {
        count = sendfile(target.get(), source.get(), nullptr, kMostAtOnce);
    } while (count > 0 || (count == -1 && errno == EINTR));
    return count == 0 ? 0 : errno;
}

}  // namespace

StoreCopy::~StoreCopy() {
    for (const std::string& file : files_) {
        unlink(file.c_str());
    }
    rmdir(folder_.c_str());
}

int StoreCopy::make(const std::string& store) {
    const char* named = std::getenv("TMPDIR");
    std::string folder = std::string(named == nullptr || *named == '\0' ? "/tmp" : named) + "/kz7-XXXXXX";
    if (mkdtemp(folder.data()) == nullptr) {
        return errno;
    }
    folder_ = std::move(folder);
    for (const char* suffix : kSuffixes) {
        files_.push_back(path() + suffix);
    }
    for (int tries = 0; tries < kTries; ++tries) {
        // A checkpoint moves pages from the log to the store, so both must be copied at one moment.
        const std::array before = {stampOf(store), stampOf(store + kLogSuffix)};
        std::remove((path() + kLogSuffix).c_str());
        int error = copyFile(store, path());
        if (error == 0 && before[1] != stampOf({})) {
            error = copyFile(store + kLogSuffix, path() + kLogSuffix);
        }
        const bool same = before == std::array{stampOf(store), stampOf(store + kLogSuffix)};
        if (same || (error != 0 && error != ENOENT)) {
            return error;
        }
    }
    return EAGAIN;
}

}  // namespace kz7
