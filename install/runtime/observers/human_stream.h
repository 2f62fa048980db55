// The stream for a person: readable texts of the catalogue on standard output, errors on standard error, as
// wide as the terminal.
#pragma once

#include <string>
#include <vector>

#include "install/runtime/observers/kz7iobs.h"
#include "install/runtime/ure.h"

namespace kz7 {

// At most one per process, like the machine stream; a run has the one or the other.
class UREExternalObserverHumanStream final : public UREExternalObserverStream {
public:
    // Makes it on the first request. Null: no memory.
    static UREExternalObserverHumanStream* getInstance(URE& ure);
    static void release();

    Status handleProgress(UREProgressInfo& info) override;
    Status handleMessage(UREInfo& info) override;

    // An empty line is the answer that is proposed, ABORT aborts, anything else is the answer.
    void handleQuery(UREInfo& info) override;

private:
    UREExternalObserverHumanStream(URE& ure, std::unique_ptr<UREExternalOutput> output);
    ~UREExternalObserverHumanStream() override;

    std::vector<std::string> linesOf(std::uint32_t textNumber, std::string_view text, std::string_view second,
                                     TerminalStream stream);
    Status writeError(std::string_view text);
    Status queueText(std::uint32_t textNumber, std::string_view text, std::string_view second, bool endsLine);

    URE& ure_;
};

}  // namespace kz7
