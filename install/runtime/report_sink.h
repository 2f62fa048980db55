// The interface through which the parts of the runtime report; the engine passes the reports to its observers. Code
// that runs without an engine uses `QuietSink`.
#pragma once

#include <cstdint>
#include <string_view>

#include "install/platform/status.h"

namespace kz7 {

inline constexpr std::uint32_t kTraceError = 0x4000001;  // the code of every trace

// `function` is the qualified name of the reporting function ("InstallProcess::execute"), `probe` the step
// in it (10, 20, ...). No operation fails; texts need to be valid during the call only. One thread.
class IReportSink {
public:
    virtual ~IReportSink() = default;

    // A record for the log only.
    virtual void trace(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value,
                       std::string_view text) = 0;

    // An error report, for the log and the front end.
    virtual void error(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value) = 0;

    // Message `number` of the catalogue, for every observer; its inserts are the source and the text.
    virtual void post(std::uint32_t number, std::uint32_t flags, std::string_view source, std::string_view insert) = 0;
};

class QuietSink final : public IReportSink {
public:
    void trace(std::uint32_t, std::string_view, std::uint32_t, Status, std::string_view) override {}
    void error(std::uint32_t, std::string_view, std::uint32_t, Status) override {}
    void post(std::uint32_t, std::uint32_t, std::string_view, std::string_view) override {}
};

}  // namespace kz7
