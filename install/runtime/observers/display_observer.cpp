#include "install/runtime/observers/display_observer.h"

#include <algorithm>

#include "install/runtime/guarded.h"
#include "install/runtime/session_text.h"

namespace kz7 {
namespace {

constexpr char kLanguageProperty[] = "KZ7_DEFAULT_LANG";
constexpr std::string_view kRightToLeftLanguages[] = {"ar_AA", "iw_IL"};

constexpr std::string_view kBoxLayout = "[1]\n\n[2]";  // the title, the text
constexpr std::string_view kLineLayout = "[1]";

}  // namespace

Status UREDisplayObserverWI::update(UREBaseInfo& info) {
    return guarded([&] {
        return info.getInfoType() == InfoType::progress ? showProgress(static_cast<const UREProgressInfo&>(info))
                                                        : showMessage(static_cast<UREInfo&>(info));
    });
}

Status UREDisplayObserverWI::showProgress(const UREProgressInfo& info) {
    if (info.kind() != ProgressKind::start) {
        return kFailed;
    }
    FixedText<kMessageSize> description;
    info.copyDescription(description);
    std::int32_t answer = 0;
    // The fields of an action start: name, description, template of its data lines.
    return show(kSessionActionStart, {kCustomActionName, description.view()}, {}, answer);
}

Status UREDisplayObserverWI::showMessage(UREInfo& info) {
    if (info.code() == kCodeTaskList) {
        return kFailed;
    }
    FixedText<kMessageSize> text;
    info.copyText(text);
    const std::string_view title = at_.ure.messages.pattern(kGenericDialogTitle);
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

// Right-to-left layout for languages that are written that way.
std::uint32_t UREDisplayObserverWI::boxDirection() {
    TextBuffer<kPropertySize> language;
    const Status status = readProperty(at_, kLanguageProperty, language);
    traceProperty(at_, "iMsiGetProperty", kLanguageProperty, status);
    const bool isRightToLeft =
        status == kSuccess && std::find(std::begin(kRightToLeftLanguages), std::end(kRightToLeftLanguages),
                                        language.text()) != std::end(kRightToLeftLanguages);
    return isRightToLeft ? kBoxRightAligned | kBoxRightToLeft : 0;
}

Status UREDisplayObserverWI::show(std::uint32_t kind, std::initializer_list<std::string_view> fields,
                                  std::string_view layout, std::int32_t& answer) {
    OwnedSessionHandle record(at_.session);
    Status status = at_.session.createRecord(static_cast<std::uint32_t>(fields.size()), record.receive());
    if (status == kSuccess && !layout.empty()) {
        status = at_.session.setRecordString(record.get(), 0, layout);
    }
    std::uint32_t field = 0;
    for (const std::string_view text : fields) {
        ++field;
        if (status == kSuccess) {
            status = at_.session.setRecordString(record.get(), field, escapedForSession(text));
        }
    }
    return status == kSuccess ? at_.session.processMessage(kind, record.get(), answer) : status;
}

}  // namespace kz7
