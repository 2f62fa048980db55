#include "install/platform/console.h"

#include <cerrno>
#include <cstdio>

#include "install/platform/host_information.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

class StandardConsole final : public IConsole {
public:
    Status writeOutput(std::string_view text) override { return noteOutput(write(stdout, text)); }

    Status writeError(std::string_view text) override {
        flush();
        const Status status = write(stderr, text);
        // Some hosts buffer this stream too if it is redirected to a file.
        return std::fflush(stderr) == 0 ? status : kWriteFault;
    }

    Status flush() override { return noteOutput(std::fflush(stdout) == 0 ? kSuccess : lastStatus()); }

private:
    static Status write(std::FILE* stream, std::string_view text) {
        return std::fwrite(text.data(), 1, text.size(), stream) == text.size() ? kSuccess : lastStatus();
    }
    static Status lastStatus() { return errno == EPIPE ? kPipeClosing : errno == ENOSPC ? kDiskFull : kWriteFault; }

    Status noteOutput(Status status) {
        output_ = succeeded(output_) ? status : output_;
        return output_;
    }

    Status output_ = kSuccess;  // the first failure: text that was buffered before it is lost
};

class HostDebugOutput final : public IDebugOutput {
public:
    HostDebugOutput(IConsole& console, void (*debugger)(std::string_view)) : console_(console), debugger_(debugger) {}

    void write(std::string_view text) override {
        if (debugger_ != nullptr) {
            debugger_(text);
        }
        if (isShown_) {
            console_.writeError("debug: " + shownText(text) + "\n");
        }
    }
    bool isHeard() const override { return isShown_ || debugger_ != nullptr; }

private:
    IConsole& console_;
    void (*debugger_)(std::string_view);
    bool isShown_ = environmentText("KZ7_DEBUG") == "1";
};

}  // namespace

std::unique_ptr<IConsole> standardConsole() {
    return std::make_unique<StandardConsole>();
}

std::unique_ptr<IDebugOutput> hostDebugOutput(IConsole& console, void (*debugger)(std::string_view text)) {
    return std::make_unique<HostDebugOutput>(console, debugger);
}

}  // namespace kz7
