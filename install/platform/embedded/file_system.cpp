#include "install/platform/embedded/ports.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <memory>
#include <string>

#include "install/platform/embedded/descriptor_table.h"
#include "install/platform/embedded/paths.h"
#include "install/platform/embedded/store_directory.h"

namespace kz7 {
namespace {

constexpr mode_t kLogFileMode = 0644;
constexpr std::size_t kReadPiece = std::size_t{64} * 1024;

Status statusOf(int error) {
    switch (error) {
        case EACCES:
        case EPERM:
        case EROFS:
        case EISDIR:
        case ENXIO:
        case ELOOP:
            return kAccessDenied;
        case ENOENT:
        case ENOTDIR:
            return kFileNotFound;
        case EEXIST:
            return kFileExists;
        case EMFILE:
        case ENFILE:
            return kTooManyOpenFiles;
        case EBADF:
            return kInvalidHandle;
        case ENOSPC:
        case EDQUOT:
        case EFBIG:
            return kDiskFull;
        case ENAMETOOLONG:
            return kFilenameExceedsRange;
        default:
            return kGeneralFailure;
    }
}

// Creates a new file that only its owner can use. 0 or an error number.
int writeNewFile(int folder, const std::string& name, std::string_view content) {
    const OwnedDescriptor file(
        openat(folder, name.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
    return file && writeAll(file.get(), content).empty() && fsync(file.get()) == 0 ? 0 : errno;
}

// Renames a file in its folder. 0 or an error number.
int publish(int folder, const std::string& from, const std::string& to, bool replace) {
    const char* const source = from.c_str();
    const char* const target = to.c_str();
    if (replace) {
        return renameat(folder, source, folder, target) == 0 ? 0 : errno;
    }
    if (renameat2(folder, source, folder, target, RENAME_NOREPLACE) == 0) {
        return 0;
    }
    // Network file systems do not support this rename. The caller removes the first name.
    return errno == EINVAL && linkat(folder, source, folder, target, 0) == 0 ? 0 : errno;
}

// The file-system port on POSIX: product paths lead to the state directory.
class EmbeddedFileSystem final : public IFileSystem {
public:
    explicit EmbeddedFileSystem(std::string stateDirectory) : stateDirectory_(std::move(stateDirectory)) {}

    Status probe(std::string_view path) override {
        const std::string host = hostPath(path, stateDirectory_);
        if (host.empty()) {
            return kFileNotFound;
        }
        if (access(host.c_str(), F_OK) == 0) {
            return kSuccess;
        }
        return errno == EACCES ? kAccessDenied : kFileNotFound;
    }

    Status readFile(std::string_view path, std::string& content) override {
        const std::string host = hostPath(path, stateDirectory_);
        if (host.empty()) {
            return kFileNotFound;
        }
        const OwnedDescriptor descriptor(open(host.c_str(), O_RDONLY | O_CLOEXEC));
        if (!descriptor) {
            return statusOf(errno);
        }
        std::string read;
        ssize_t count = 0;
        do {
            const std::size_t length = read.size();
            read.resize(length + kReadPiece);
            count = ::read(descriptor.get(), read.data() + length, kReadPiece);
            read.resize(length + (count > 0 ? static_cast<std::size_t>(count) : 0));
        } while (count > 0 || (count == -1 && errno == EINTR));
        if (count == -1) {
            return statusOf(errno);
        }
        content = std::move(read);
        return kSuccess;
    }

    Status openForAppend(std::string_view path, FileHandle& file) override {
        const std::string host = hostPath(path, stateDirectory_);
        if (host.empty()) {
            return kFileNotFound;
        }
        // Does not follow a link, which another user could have created in a shared directory, and does not wait for
        // the reader of a pipe.
        OwnedDescriptor descriptor(
            open(host.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK, kLogFileMode));
        if (!descriptor) {
            return errno == ENOENT || errno == ENOTDIR ? kPathNotFound : statusOf(errno);
        }
        struct stat found {};
        if (fstat(descriptor.get(), &found) == -1 || !S_ISREG(found.st_mode) || found.st_nlink != 1) {
            return kAccessDenied;
        }
        file = files_.give(std::move(descriptor));
        return kSuccess;
    }

    Status write(FileHandle file, std::string_view data, std::uint32_t& written) override {
        const std::string_view left = writeAll(files_.find(file), data);
        written = static_cast<std::uint32_t>(data.size() - left.size());
        return left.empty() ? kSuccess : statusOf(errno);
    }

    Status closeFile(FileHandle file) override {
        OwnedDescriptor taken = files_.take(file);
        const int descriptor = taken.get();
        taken.leaveOpen();  // some file systems report a failed write only when the file is closed
        return close(descriptor) == 0 ? kSuccess : statusOf(errno);
    }

    Status writeFile(std::string_view path, std::string_view content, bool replace) override {
        const std::string host = hostPath(path, stateDirectory_);
        const std::size_t cut = host.find_last_of('/') + 1;
        const std::string name = host.substr(cut);
        if (cut == 0 || name.empty()) {
            return kBadPathname;
        }
        const OwnedDescriptor folder(open(host.substr(0, cut).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
        if (!folder) {
            return errno == ENOENT || errno == ENOTDIR ? kPathNotFound : statusOf(errno);
        }
        struct stat found {};
        if (fstatat(folder.get(), name.c_str(), &found, AT_SYMLINK_NOFOLLOW) == 0 &&
            (!S_ISREG(found.st_mode) || !replace)) {
            return S_ISREG(found.st_mode) ? kFileExists : kBadPathname;
        }
        std::string unfinished;
        if (!randomName(".kz7-", unfinished)) {
            return statusOf(errno);
        }
        int error = writeNewFile(folder.get(), unfinished, content);
        if (error == 0) {
            error = publish(folder.get(), unfinished, name, replace);
        }
        // Has no effect after a rename.
        unlinkat(folder.get(), unfinished.c_str(), 0);
        if (error == 0 && fsync(folder.get()) != 0) {
            error = errno;
        }
        return error == 0 ? kSuccess : statusOf(error);
    }

    Status listFiles(std::string_view folder, std::vector<std::string>& names) override {
        const std::string host = hostPath(folder, stateDirectory_);
        std::vector<std::string> found;
        if (const int error = namesIn(host, found); error != 0) {
            return statusOf(error);
        }
        std::erase_if(found, [&](const std::string& name) {
            struct stat entry {};
            return stat((host + '/' + name).c_str(), &entry) != 0 || !S_ISREG(entry.st_mode);
        });
        names = std::move(found);
        return kSuccess;
    }
    Status productPath(std::string_view hostPath, std::string& path) override {
        std::error_code error;
        std::string whole = std::filesystem::absolute(hostPath, error).string();
        // A backslash is a separator in product paths.
        if (error || whole.find('\\') != std::string::npos || whole.find('\0') != std::string::npos) {
            return kInvalidName;
        }
        std::replace(whole.begin(), whole.end(), '/', '\\');
        path = std::move(whole);
        return kSuccess;
    }

    std::string shownPath(std::string_view path) override {
        const std::string host = hostPath(path, stateDirectory_);
        return host.empty() ? std::string(path) : host;
    }

private:
    std::string stateDirectory_;
    DescriptorTable<FileHandle> files_;
};

}  // namespace

std::unique_ptr<IFileSystem> embeddedFiles(std::string stateDirectory) {
    return std::make_unique<EmbeddedFileSystem>(std::move(stateDirectory));
}

}  // namespace kz7
