// The runtime engine: the state of one installer run, its message texts, and the observers that get every info in turn.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "install/platform/console.h"
#include "install/platform/file_system.h"
#include "install/platform/host_information.h"
#include "install/platform/installer_session.h"
#include "install/platform/process_host.h"
#include "install/platform/terminal.h"
#include "install/platform/threads.h"
#include "install/runtime/infos.h"
#include "install/runtime/message_catalogue.h"
#include "install/runtime/observers/kz7iobs.h"
#include "install/runtime/report_sink.h"
#include "install/runtime/response_file.h"

namespace kz7 {

// The kind of run. The log is titled by the first of these bits that is set, in this order.
// clang-format off
inline constexpr std::uint32_t kModeInstall   = 0x01;
inline constexpr std::uint32_t kModeUpdate    = 0x02;
inline constexpr std::uint32_t kModeRemove    = 0x04;
inline constexpr std::uint32_t kModeConfigure = 0x10;
// clang-format on

inline constexpr char kProductKeyword[] = "PROD";  // of a response file, and the installer property of that name

// The ports outlive the engine.
struct RuntimePorts {
    IFileSystem& files;
    IProcessHost& processes;
    IThreads& threads;
    IConsole& console;
    ITerminal& terminal;
    IHostInformation& host;
    IInstallerSession* session = nullptr;  // null: no installer session
};

// Which infos an observer gets. Only the log gets traces: a success must not reach a front end as an error.
enum class Takes { everything, allButTraces };

// No exception leaves an operation. Statuses are kSuccess or kNoMemory, with the object unchanged, unless stated
// otherwise. One thread.
class URE final : public IObservable, public IReportSink {
public:
    explicit URE(const RuntimePorts& runtimePorts) : ports(runtimePorts) {}

    const RuntimePorts ports;
    MessageCatalogue messages;
    std::uint32_t mode = 0;
    std::string productAbbreviation;
    std::string installationPath;
    std::vector<ResponseKeyword> responses;  // of the response file, in its order; empty without one

    // Keeps the keywords of a response file; its kProductKeyword is the product's abbreviation.
    Status takeResponses(std::vector<ResponseKeyword> keywords);

    // Read the response file or the message catalogue at `path`. A file that cannot be read or has a bad line is
    // reported with `setting`, the property or variable that names it, and changes nothing. The reader's status.
    Status readResponses(std::string_view setting, std::string_view path);
    Status readMessages(std::string_view setting, std::string_view path);

    // Each is called while it is registered; the caller unregisters it before it is destroyed. Infos that an observer
    // raises while it is being called do not reach it, and what it throws is dropped.
    Status registerObserver(IObserver& observer, Takes takes = Takes::allButTraces);
    void unregisterObserver(IObserver& observer);

    // Gets the progress of tasks in addition to the observers. Null: no such observer.
    void setProgressObserver(IProgressObserver* observer) { progressObserver_ = observer; }

    void startTask(std::uint64_t startValue, std::int32_t task, bool installation, std::string_view description);
    void endTask(std::int32_t task, bool installation, std::string_view description);

    // `taskList` has entries of identifier and time: "10,30;11,45".
    void announceTasks(std::string_view taskList);

    // Raises text `textNumber` of the catalogue as a message or as a trace.
    void message(std::uint32_t code, std::uint32_t textNumber, std::span<const Insert> inserts);
    void traceMessage(std::uint32_t textNumber, std::span<const Insert> inserts);

    // Asks question `number`; `answer` is what the user answered, and unchanged for any other response. An answer that
    // no memory is left for is no response. The caller decides what an unanswered question means.
    UREInfo::Response ask(std::uint32_t number, std::uint32_t textNumber, std::span<const Insert> inserts,
                          std::string_view defaultValue, std::string& answer);

    // An error report with a text of its own.
    void report(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value,
                std::string_view text);

    void trace(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value,
               std::string_view text) override;
    void error(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value) override;
    void post(std::uint32_t number, std::uint32_t flags, std::string_view source, std::string_view insert) override;

private:
    struct Registered {
        IObserver* observer;
        Takes takes;
        bool isCalled = false;
    };

    void handOut(UREBaseInfo& info, bool isTrace);
    void raiseProgress(UREProgressInfo info);
    void reportFile(std::string_view function, std::string_view setting, std::string_view path, Status status,
                    const ResponseFault& fault);
    void raiseReport(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value,
                     std::string_view text, bool isTrace);

    std::vector<Registered> observers_;
    IProgressObserver* progressObserver_ = nullptr;
};

}  // namespace kz7
