#include "install/admin/configuration_run.h"

#include "install/runtime/config_handler.h"
#include "install/runtime/observers/observers_end.h"
#include "install/runtime/runtime_ports.h"

namespace kz7 {
namespace {

constexpr std::int32_t kVariablesTask = 1;
constexpr std::int32_t kParametersTask = 2;
constexpr std::string_view kTasks = "1,10;2,90";  // with their shares of the time
constexpr std::uint64_t kParametersStart = 10;

// The log and the stream of one run.
class Observers {
public:
    Observers(URE& engine, const std::string& logFile, bool machine) : engine_(engine) {
        if (!logFile.empty()) {
            log_ = URELogObserver::getInstance(engine);
        }
        if (machine) {
            stream_ = UREExternalObserverMachineStream::getInstance(engine);
        } else {
            stream_ = UREExternalObserverHumanStream::getInstance(engine);
        }
        if (stream_ != nullptr) {
            engine.registerObserver(*stream_);
        }
        if (log_ != nullptr) {
            log_->setLogFile(logFile);
            engine.registerObserver(*log_, Takes::everything);
        }
    }
    Observers(const Observers&) = delete;
    Observers& operator=(const Observers&) = delete;
    ~Observers() {
        if (log_ != nullptr) {
            log_->writeHeader(true);
            engine_.unregisterObserver(*log_);
        }
        if (stream_ != nullptr) {
            engine_.unregisterObserver(*stream_);
        }
    }

private:
    ObserversEnd end_;
    URE& engine_;
    URELogObserver* log_ = nullptr;
    UREExternalObserverStream* stream_ = nullptr;
};

// Records the names of the response file and reports those that are unknown; returns their number.
std::uint32_t record(URE& engine, KZ7CfgHandler& handler) {
    std::uint32_t unknown = 0;
    for (const ResponseKeyword& keyword : engine.responses) {
        if (!equalsIgnoreCase(keyword.name, kProductKeyword) &&
            handler.recordVariable(keyword.name, keyword.value) != kSuccess &&
            handler.recordParameter(keyword.name, keyword.value) != kSuccess) {
            const std::array<Insert, 2> inserts = {keyword.name, keyword.line};
            engine.message(kCodeError, kUnknownNameMessage, inserts);
            ++unknown;
        }
    }
    return unknown;
}

}  // namespace

ConfigurationOutcome runConfiguration(const Ports& ports, ConfigurationRequest request) {
    ProfileRegistry profile(*ports.registry, request.copy);
    // Ends the transaction of the lookups: others can write while the log is opened.
    profile.settle();
    URE engine(portsOf(ports));
    engine.mode = kModeConfigure;
    engine.installationPath = std::move(request.location);
    engine.takeResponses(std::move(request.responses));
    // Before the log begins, for its header. A bad file is read again afterwards: only then is its error seen.
    const bool isBad =
        !request.messageFile.empty() && engine.readMessages(kMessagesVariable, request.messageFile) != kSuccess;
    const Observers observers(engine, request.logFile, request.machine);
    if (isBad) {
        engine.readMessages(kMessagesVariable, request.messageFile);
    }

    ConfigurationTarget target;
    target.instance.assign(request.instance);
    target.profile.assign(request.instance);
    KZ7CfgHandler handler(engine, profile, target);

    ConfigurationOutcome outcome;
    engine.announceTasks(kTasks);
    const std::uint32_t unknown = record(engine, handler);
    engine.startTask(0, kVariablesTask, false, "Setting registry variables");
    handler.commitProfileReg();
    // The command processor reads the variables.
    outcome.kept = profile.settle();
    if (outcome.kept != kSuccess) {
        engine.error(kCodeError, "KZ7CfgHandler::commitProfileReg", 10, outcome.kept);
    }
    engine.endTask(kVariablesTask, false, "Setting registry variables");
    if (outcome.kept == kSuccess) {
        engine.startTask(kParametersStart, kParametersTask, false, "Setting database-manager parameters");
        handler.commitDBMCfg(request.instance);
        engine.endTask(kParametersTask, false, "Setting database-manager parameters");
    }
    outcome.set = handler.successes();
    outcome.notSet = handler.failures() + unknown;
    return outcome;
}

}  // namespace kz7
