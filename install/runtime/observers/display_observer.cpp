#include "install/runtime/observers/display_observer.h"

#include <new>

#include "install/runtime/session_text.h"

namespace kz7 {
namespace {

constexpr std::string_view kLanguageProperty = "KZ7_DEFAULT_LANG";
constexpr std::string_view kRightToLeftLanguages[] = {"ar_AA", "iw_IL"};

constexpr std::string_view kBoxLayout = "[1]\n\n[2]";  // the title, the text
constexpr std::string_view kLineLayout = "[1]";

}  // namespace

Status UREDisplayObserverWI::update(UREBaseInfo& info) {
    try {
        return info.getInfoType() == InfoType::progress ? showProgress(static_cast<const UREProgressInfo&>(info))
                                                        : showMessage(static_cast<UREInfo&>(info));
    } catch (const std::bad_alloc&) {
        return kNoMemory;
    }
}

Status UREDisplayObserverWI::showProgress(const UREProgressInfo& info) {
    if (info.kind() != ProgressKind::start) {
        return kFailed;
    }
    FixedText<kMessageSize> description;
    info.copyDescription(description);
    std::int32_t answer = 0;
    // An action start names the action, says what it does, and lays out its data lines.
    return show(kSessionActionStart, {kCustomActionName, description.view()}, {}, answer);
}

Status UREDisplayObserverWI::showMessage(UREInfo& info) {
    if (info.code() == kCodeTaskList) {
        return kFailed;
    }
    FixedText<kMessageSize> text;
    info.copyText(text);
    const std::string_view title = ure_.messages.pattern(kGenericDialogTitle);
    std::int32_t answer = 0;
    if (info.isQuestion()) {
        const Status status = show(kSessionUser | kBoxOkCancel | kBoxQuestionIcon | boxDirection(),
                                   {title, text.view()}, kBoxLayout, answer);
        if (answer == kBoxAnswerOk) {
            info.setResponse(FixedText<kMessageSize>(info.defaultValue()).c_str());
        } else if (answer == kBoxAnswerCancel) {
            info.setResponse(nullptr);
        }
        return status;
    }
    switch (info.messageClass()) {
        case kClassError:
        case kClassOtherError:
            return show(kSessionError | kBoxErrorIcon | boxDirection(), {title, text.view()}, kBoxLayout, answer);
        case kClassInformation:
            return show(kSessionActionData, {text.view()}, kLineLayout, answer);
        default:
            return kFailed;
    }
}

// Boxes of languages that are written from right to left are laid out so.
std::uint32_t UREDisplayObserverWI::boxDirection() {
    FixedBuffer<kMessageSize> language;
    if (session_.getProperty(kLanguageProperty, language) == kSuccess) {
        for (const std::string_view each : kRightToLeftLanguages) {
            if (language.text() == each) {
                return kBoxRightAligned | kBoxRightToLeft;
            }
        }
    }
    return 0;
}

Status UREDisplayObserverWI::show(std::uint32_t kind, std::initializer_list<std::string_view> fields,
                                  std::string_view layout, std::int32_t& answer) {
    OwnedSessionHandle record(session_);
    Status status = session_.createRecord(static_cast<std::uint32_t>(fields.size()), record.receive());
    if (status == kSuccess && !layout.empty()) {
        status = session_.setRecordString(record.get(), 0, layout);
    }
    std::uint32_t field = 0;
    for (const std::string_view text : fields) {
        ++field;
        if (status == kSuccess) {
            status = session_.setRecordString(record.get(), field, escapedForSession(text));
        }
    }
    return status == kSuccess ? session_.processMessage(kind, record.get(), answer) : status;
}

}  // namespace kz7
