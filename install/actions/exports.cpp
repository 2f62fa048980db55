// The custom actions. Each call builds what it needs and leaves nothing behind: the installer loads the library anew
// for every action, other libraries keep it.
#include <memory>
#include <new>

#include "install/actions/kz7actions.h"
#include "install/platform/installer_session.h"
#include "install/platform/platform.h"
#include "install/runtime/installer_properties.h"
#include "install/runtime/observers/display_observer.h"
#include "install/runtime/observers/observers_end.h"
#include "install/runtime/runtime_ports.h"
#include "install/src/registry/copy_name.h"

namespace kz7 {
namespace {

constexpr char kResponseFile[] = "RSP_FILE_PATH";
constexpr char kMessageFile[] = "KZ7_MESSAGES";

// One call: this machine, the installation, and an engine whose log is the installer's.
class ActionCall {
public:
    explicit ActionCall(std::uint32_t installation)
        : platform_(hostPlatform({.program = "kz7actions64", .ownProcess = false})),
          session_(hostInstallerSession(installation)),
          engine_(portsOf(*platform_, session_.get())),
          at_{*session_, platform_->registry(), engine_},
          display_(at_) {
        // Without memory for an observer the action does its work unobserved.
        if (URELogObserver* log = URELogObserver::getInstance(engine_); log != nullptr) {
            engine_.registerObserver(*log, Takes::everything);
        }
        engine_.registerObserver(display_);
    }

    const Installation& at() const { return at_; }

    void readMessages() { readNamedFile(kMessageFile, &URE::readMessages); }
    void readResponses() { readNamedFile(kResponseFile, &URE::readResponses); }

    // Runs the work of an action that changes the registry, as a task with that description.
    Status runTask(std::uint32_t description, Status (*work)(const Installation&)) {
        constexpr std::int32_t kTask = 1;
        const std::string_view text = engine_.messages.plainText(description);
        engine_.startTask(0, kTask, true, text);
        const Status status = work(at_);
        engine_.endTask(kTask, true, text);
        const Status kept = platform_->registry().commit();
        return status != kSuccess ? status : kept;
    }

private:
    // Reads a file that a property names. The installer is asked, not the saved values: the user can write those.
    void readNamedFile(const char* property, Status (URE::*read)(std::string_view, std::string_view)) {
        FixedBuffer<kPropertySize> path;
        const Status status = session_->getProperty(property, path);
        traceProperty(at_, "iMsiGetProperty", property, status);
        if (status == kSuccess && !path.text().empty()) {
            (engine_.*read)(property, path.text());
        }
    }

    std::unique_ptr<IPlatform> platform_;
    std::unique_ptr<IInstallerSession> session_;
    URE engine_;
    ObserversEnd observersEnd_;
    Installation at_;
    UREDisplayObserverWI display_;
};

// Nothing is thrown into the installer.
template <typename Work>
std::uint32_t call(std::uint32_t installation, Work work) {
    try {
        ActionCall action(installation);
        return work(action);
    } catch (const std::bad_alloc&) {
        return kNoMemory;
    } catch (...) {
        return kGeneralFailure;
    }
}

}  // namespace
}  // namespace kz7

using kz7::ActionCall;

extern "C" {

std::uint32_t iSavePropertiesForDeferred(std::uint32_t installation) {
    return kz7::call(installation, [](ActionCall& action) {
        action.readMessages();
        action.readResponses();
        return action.runTask(kz7::kSavingMessage, kz7::iSavePropertiesForDeferred);
    });
}

std::uint32_t iDeleteSavedProperties(std::uint32_t installation) {
    return kz7::call(installation, [](ActionCall& action) {
        action.readMessages();
        return action.runTask(kz7::kDeletingMessage, kz7::iDeleteSavedProperties);
    });
}

std::uint32_t iMsiGetProperty(std::uint32_t installation, const char* name, char* buffer, std::uint32_t* size) {
    return kz7::call(installation, [&](ActionCall& action) {
        const kz7::Status status = kz7::iMsiGetProperty(action.at(), name, buffer, size);
        kz7::traceProperty(action.at(), "iMsiGetProperty", name != nullptr ? name : "", status);
        return status;
    });
}

std::uint32_t iMsiSetProperty(std::uint32_t installation, const char* name, const char* value) {
    return kz7::call(installation, [&](ActionCall& action) {
        const kz7::Status status = kz7::iMsiSetProperty(action.at(), name, value);
        kz7::traceProperty(action.at(), "iMsiSetProperty", name != nullptr ? name : "", status);
        return status;
    });
}

const char* iSubstituteCopyName(const char* text, const char* copyName, std::uint32_t outputSize, char* output) {
    try {
        return kz7::iSubstituteCopyName(text, copyName, outputSize, output);
    } catch (...) {
        return nullptr;
    }
}

}  // extern "C"
