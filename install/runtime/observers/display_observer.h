// Shows infos in the installer's user interface: tasks as actions, messages as their details, errors and questions in
// message boxes.
#pragma once

#include "install/runtime/installer_properties.h"
#include "install/runtime/observers/kz7iobs.h"

namespace kz7 {

// Boxes open only if the installer shows a user interface. The installation outlives the object.
class UREDisplayObserverWI final : public IObserver {
public:
    explicit UREDisplayObserverWI(const Installation& at) : at_(at) {}

    // The session's status, or kFailed for an info that is not shown.
    Status update(UREBaseInfo& info) override;

private:
    Status showProgress(const UREProgressInfo& info);
    Status showMessage(UREInfo& info);
    Status show(std::uint32_t kind, std::initializer_list<std::string_view> fields, std::string_view layout,
                std::int32_t& answer);
    std::uint32_t boxDirection();

    const Installation& at_;
};

}  // namespace kz7
