// A command with its output captured, and its results as one text.
#pragma once

#include <string>

#include "install/platform/text.h"
#include "install/runtime/install_process.h"

namespace kz7::test {

// Records the messages, a line each, and the texts that were posted last.
class ListedSink final : public IReportSink {
public:
    void trace(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value,
               std::string_view text) override {
        lines += compose("trace %u %s %u %u %s\n", {code, function, probe, value, text});
    }
    void error(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value) override {
        lines += compose("error %u %s %u %u\n", {code, function, probe, value});
    }
    void post(std::uint32_t number, std::uint32_t flags, std::string_view source, std::string_view insert) override {
        lines += compose("post %u %u %s\n", {number, flags, source});
        (number == kStandardOutputMessage ? output : standardError) = insert;
    }

    std::string lines;
    std::string output;
    std::string standardError;
};

// Waits for the end: "status code output|error", without the bar if standard error is empty.
inline std::string ending(InstallProcess& process, ListedSink& sink, std::uint32_t timeout = kInfiniteWait) {
    std::uint32_t code = 77;
    const Status status = process.waitForCompletion(code, timeout);
    sink.output.clear();
    sink.standardError.clear();
    process.postOutput("run", 0);
    std::erase(sink.output, '\r');
    return std::to_string(status) + " " + std::to_string(code) + " " + sink.output +
           (sink.standardError.empty() ? "" : "|") + sink.standardError;
}

}  // namespace kz7::test
