// The ports for the console and the debugger: the C library's standard output and standard error of this process. They
// are not the process's standard-handle slots: redirecting a slot never redirects what is written here.
#pragma once

#include <memory>
#include <string_view>

#include "install/platform/status.h"

namespace kz7 {

// Texts are never cut. Files and pipes get the narrow encoding and the line ends of the host. kPipeClosing: the reader
// has closed the pipe, which raises no signal. One thread.
class IConsole {
public:
    virtual ~IConsole() = default;

    virtual Status writeOutput(std::string_view text) = 0;

    // Flushes standard output first, so that both in one file keep their order.
    virtual Status writeError(std::string_view text) = 0;

    // Writes output for programs: files and pipes get the bytes unchanged on every host.
    virtual Status writeDocument(std::string_view text) { return writeOutput(text); }

    // Returns the first failure of standard output so far: kPipeClosing if the reader has closed the pipe.
    virtual Status flush() = 0;

    // Whether all texts are dropped, so that none need be composed.
    virtual bool isSilent() const { return false; }
};

// The streams of the C library, on every host.
std::unique_ptr<IConsole> standardConsole();

// Diagnostic texts that are not for the console.
class IDebugOutput {
public:
    virtual ~IDebugOutput() = default;

    // Sends one message; cannot fail. If KZ7_DEBUG=1 is set the message is also written to standard error.
    virtual void write(std::string_view text) = 0;

    // False if nobody can see the messages, so that a caller with many of them need not compose them.
    virtual bool isHeard() const { return true; }
};

// `debugger` passes a text to the debugger of this host; null on a host without one.
std::unique_ptr<IDebugOutput> hostDebugOutput(IConsole& console, void (*debugger)(std::string_view text));

}  // namespace kz7
