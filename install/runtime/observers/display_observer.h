// Shows infos in the installer's own user interface: tasks as actions, messages beneath them, errors and
// questions in boxes.
#pragma once

#include "install/platform/installer_session.h"
#include "install/runtime/observers/kz7iobs.h"
#include "install/runtime/ure.h"

namespace kz7 {

// Boxes open only where the installer shows any. The engine and the session outlive it.
class UREDisplayObserverWI final : public IObserver {
public:
    UREDisplayObserverWI(URE& ure, IInstallerSession& session) : ure_(ure), session_(session) {}

    // The session's status, or kFailed for an info that is not shown.
    Status update(UREBaseInfo& info) override;

private:
    Status showProgress(const UREProgressInfo& info);
    Status showMessage(UREInfo& info);
    Status show(std::uint32_t kind, std::initializer_list<std::string_view> fields, std::string_view layout,
                std::int32_t& answer);
    std::uint32_t boxDirection();

    URE& ure_;
    IInstallerSession& session_;
};

}  // namespace kz7
