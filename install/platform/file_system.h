// The file-system port: the few questions about files that the flows ask, and files that are written line by
// line.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "install/platform/owned_handle.h"
#include "install/platform/status.h"

namespace kz7 {

// A file that is open for writing.
enum class FileHandle : std::uint64_t { none = 0 };

// Paths are the product's: `X:\a\b` names one place, in the state directory where the host has no drives. So do
// `\\host\share` on Windows and, elsewhere, the host's own path, which begins with a separator. Any other names
// nothing, on Windows `\a` too: nothing is ever taken from the directory or the drive that the tool happens to be
// run in.
class IFileSystem {
public:
    virtual ~IFileSystem() = default;

    // kFileNotFound: there is no file or folder of that name, or its folder is missing.
    virtual Status probe(std::string_view path) = 0;

    // All of a file. kFileNotFound as above.
    virtual Status readFile(std::string_view path, std::string& content) = 0;

    // Opens a file for writing at its end, making one that is missing for its owner and readers. The caller
    // closes it. kPathNotFound: its folder is missing; kAccessDenied: also a link, or
    // what is no file, where the file should be.
    virtual Status openForAppend(std::string_view path, FileHandle& file) = 0;

    // Writes at the end, at once. `written` tells the bytes that were taken, on a failure too; a success may
    // have taken less than all.
    virtual Status write(FileHandle file, std::string_view data, std::uint32_t& written) = 0;

    virtual Status closeFile(FileHandle file) = 0;

    // The name, without its folder, of the first file in name order that fits a pattern: a path in whose last
    // name '?' stands for any one character. kFileNotFound: none.
    virtual Status findFile(std::string_view pattern, std::string& name) = 0;

    // The product's path for what people here call one; a relative one begins in the folder the process was
    // started in. kInvalidName: the product has none.
    virtual Status productPath(std::string_view hostPath, std::string& path) = 0;

    // What people here call a path.
    virtual std::string shownPath(std::string_view path) = 0;
};

struct FileTraits {
    using Port = IFileSystem;
    using Handle = FileHandle;
    static constexpr Handle kNone = FileHandle::none;
    static void close(Port& port, Handle file) { port.closeFile(file); }
};
using OwnedFile = OwnedHandle<FileTraits>;

// A name against a pattern of the same length in which '?' stands for any character; case does not matter.
bool fitsPattern(std::string_view name, std::string_view pattern);

}  // namespace kz7
