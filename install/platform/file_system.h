// The file-system port: the few questions about files that the flows ask.
#pragma once

#include <string_view>

#include "install/platform/status.h"

namespace kz7 {

// Paths are the product's: a drive letter or a leading separator makes one absolute. Where the host has
// no drives, `X:\a\b` lies in the state directory, and a relative path with a folder in it names nothing:
// nothing is ever taken from the directory that the tool happens to be run in.
class IFileSystem {
public:
    virtual ~IFileSystem() = default;

    // kFileNotFound: there is no file or folder of that name, or its folder is missing.
    virtual Status probe(std::string_view path) = 0;
};

}  // namespace kz7
