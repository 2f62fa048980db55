// The custom actions. Each call builds what it needs and leaves nothing behind: the installer loads the library anew
// for every action, other libraries keep it.
#include <memory>
#include <new>

#include "install/actions/kz7actions.h"
#include "install/platform/installer_session.h"
#include "install/platform/platform.h"
#include "install/runtime/installer_properties.h"
#include "install/runtime/observers/observers_end.h"
#include "install/runtime/runtime_ports.h"
#include "install/src/registry/copy_name.h"

namespace kz7 {
namespace {

constexpr char kResponseFile[] = "RSP_FILE_PATH";

// One call: this machine, the installation, and an engine whose log is the installer's.
class ActionCall {
public:
    explicit ActionCall(std::uint32_t installation)
        : platform_(hostPlatform({.program = "kz7actions64", .ownProcess = false})),
          session_(hostInstallerSession(installation)),
          engine_(portsOf(*platform_, session_.get())),
          at_{*session_, platform_->registry(), engine_} {
        if (URELogObserver* log = URELogObserver::getInstance(engine_); log != nullptr) {
            engine_.registerObserver(*log, Takes::everything);
        }
    }

    const Installation& at() const { return at_; }

    // The end of an action that changed the registry.
    Status ended(Status status) {
        const Status kept = platform_->registry().commit();
        return status != kSuccess ? status : kept;
    }

    // A response file that cannot be read is reported, and none is in use then.
    void readResponses() {
        FixedBuffer<kPropertySize> path;
        if (session_->getProperty(kResponseFile, path) != kSuccess || path.text().empty()) {
            return;
        }
        std::vector<ResponseKeyword> keywords;
        ResponseFault fault;
        const Status status = ureReadRspFile(platform_->files(), path.text(), keywords, fault);
        if (status == kSuccess) {
            engine_.takeResponses(std::move(keywords));
        } else {
            engine_.report(kCodeError, "ureReadRspFile", fault.line, status, fault.reason);
        }
    }

private:
    std::unique_ptr<IPlatform> platform_;
    std::unique_ptr<IInstallerSession> session_;
    URE engine_;
    ObserversEnd observersEnd_;
    Installation at_;
};

// Nothing is thrown into the installer.
template <typename Work>
std::uint32_t call(std::uint32_t installation, Work work) {
    try {
        ActionCall action(installation);
        return work(action);
    } catch (const std::bad_alloc&) {
        return kOutOfMemory;
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
        action.readResponses();
        return action.ended(kz7::iSavePropertiesForDeferred(action.at()));
    });
}

std::uint32_t iDeleteSavedProperties(std::uint32_t installation) {
    return kz7::call(installation,
                     [](ActionCall& action) { return action.ended(kz7::iDeleteSavedProperties(action.at())); });
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
        return text != nullptr ? kz7::iSubstituteCopyName(text, copyName, outputSize, output) : nullptr;
    } catch (...) {
        return nullptr;
    }
}

}  // extern "C"
