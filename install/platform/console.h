// The console port: the C library's standard output and standard error of this process. They are not the
// process's standard-handle slots: redirecting a slot never redirects what is written here.
#pragma once

#include <memory>
#include <string_view>

#include "install/platform/status.h"

namespace kz7 {

// Texts are written whole and uncut, to a file or pipe in the narrow encoding of the host; a line feed ends a line in
// the host's own way. kPipeClosing: the reader is gone, which is never a signal. One thread.
class IConsole {
public:
    virtual ~IConsole() = default;

    virtual Status writeOutput(std::string_view text) = 0;

    // Flushes standard output first, so that both in one file keep their order.
    virtual Status writeError(std::string_view text) = 0;

    // Standard output that programs read: UTF-8, or the bytes as they are, in a file or pipe on every host.
    virtual Status writeDocument(std::string_view text) { return writeOutput(text); }

    // The first failure of standard output so far, if any: kPipeClosing for a reader that is gone.
    virtual Status flush() = 0;
};

// The streams of the C library, on every host.
std::unique_ptr<IConsole> standardConsole();

}  // namespace kz7
