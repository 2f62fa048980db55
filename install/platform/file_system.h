// The file-system port: tests, reads and writes whole files, and appends to log files.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "install/platform/owned_handle.h"
#include "install/platform/status.h"

namespace kz7 {

// A file that is open for writing.
enum class FileHandle : std::uint64_t { none = 0 };

// Product paths are absolute: `X:\a\b`, which lies in the state directory on hosts without drives; `\\host\share` on
// Windows; elsewhere also the host's own path, which begins with a separator. Any other path names nothing, on Windows
// `\a` too, so that nothing depends on the current directory or drive.
class IFileSystem {
public:
    virtual ~IFileSystem() = default;

    // kFileNotFound: no file or folder has that name, or its folder is missing.
    virtual Status probe(std::string_view path) = 0;

    // Reads a whole file. kFileNotFound as above.
    virtual Status readFile(std::string_view path, std::string& content) = 0;

    // Opens a file for writing at its end; creates a missing one that others can read. The caller closes it.
    // kPathNotFound: its folder is missing. kAccessDenied: also for a link, a file with several names and anything else
    // that is not a file; on Windows also if a folder of the path is a link.
    virtual Status openForAppend(std::string_view path, FileHandle& file) = 0;

    // Writes at the end, unbuffered. `written` is the number of bytes written, on a failure too; a success may write
    // fewer than all.
    virtual Status write(FileHandle file, std::string_view data, std::uint32_t& written) = 0;

    virtual Status closeFile(FileHandle file) = 0;

    // Writes a whole file under a temporary name in the same folder, syncs it and renames it: the path names the old or
    // the new content at any time. A new file belongs to its owner alone where the host has file modes. kFileExists:
    // the path exists and `replace` is false. kPathNotFound: the folder is missing. kBadPathname: the path is empty, or
    // names a link, a folder or a device.
    virtual Status writeFile(std::string_view path, std::string_view content, bool replace) = 0;

    // The names of the files in a folder, sorted. kFileNotFound: the folder does not exist.
    virtual Status listFiles(std::string_view folder, std::vector<std::string>& names) = 0;

    // Converts a path as users of this host write it; a relative one starts in the current directory.
    // kInvalidName: no product path exists for it.
    virtual Status productPath(std::string_view hostPath, std::string& path) = 0;

    // The path as users of this host write it.
    virtual std::string shownPath(std::string_view path) = 0;
};

using OwnedFile = OwnedHandle<PortTraits<IFileSystem, FileHandle, &IFileSystem::closeFile>>;

// Finds the first file, in name order, that matches a pattern: a path whose last name may contain '?' for any one
// character. Ignores case. `name` is without the folder. kFileNotFound: no file matches.
Status findFile(IFileSystem& files, std::string_view pattern, std::string& name);

}  // namespace kz7
