// The stream for people: texts of the catalogue on standard output and errors on standard error, wrapped to the width
// of the terminal.
#pragma once

#include <string>
#include <vector>

#include "install/runtime/observers/kz7iobs.h"
#include "install/runtime/ure.h"

namespace kz7 {

// At most one per process, as is the machine stream; a run uses one of the two.
class UREExternalObserverHumanStream final : public UREExternalObserverStream {
public:
    // Creates it on the first call. Null: no memory.
    static UREExternalObserverHumanStream* getInstance(URE& ure);
    static void release();

    Status handleProgress(UREProgressInfo& info) override;
    Status handleMessage(UREInfo& info) override;

    // An empty line accepts the proposed answer, ABORT aborts, any other line is the answer.
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
