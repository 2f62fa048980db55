#include "install/platform/console.h"

#include <cerrno>
#include <cstdio>

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

}  // namespace

std::unique_ptr<IConsole> standardConsole() {
    return std::make_unique<StandardConsole>();
}

}  // namespace kz7
