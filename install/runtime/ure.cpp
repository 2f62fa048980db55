#include "install/runtime/ure.h"

#include <algorithm>
#include <array>

#include "install/runtime/guarded.h"

namespace kz7 {
namespace {

// The runtime's own codes, which the catalogue has words for; below are the system's.
constexpr Status kFirstOwnStatus = 5000;
constexpr Status kLastOwnStatus = 6100;

}  // namespace

Status URE::takeResponses(std::vector<ResponseKeyword> keywords) {
    return guarded([&] {
        for (const ResponseKeyword& keyword : keywords) {
            if (equalsIgnoreCase(keyword.name, kProductKeyword)) {
                productAbbreviation = keyword.value;
            }
        }
        responses = std::move(keywords);
        return kSuccess;
    });
}

Status URE::readResponses(std::string_view setting, std::string_view path) {
    std::vector<ResponseKeyword> keywords;
    ResponseFault fault;
    const Status status = ureReadRspFile(ports.files, path, keywords, fault);
    if (status != kSuccess) {
        reportFile("ureReadRspFile", setting, path, status, fault);
        return status;
    }
    return takeResponses(std::move(keywords));
}

Status URE::readMessages(std::string_view setting, std::string_view path) {
    std::string file;
    ResponseFault fault{0, kUnreadableReason};
    Status status = guarded([&] { return ports.files.readFile(path, file); });
    if (status == kSuccess) {
        status = messages.load(file, fault);
    }
    if (status != kSuccess) {
        reportFile("MessageCatalogue::load", setting, path, status, fault);
    }
    return status;
}

void URE::reportFile(std::string_view function, std::string_view setting, std::string_view path, Status status,
                     const ResponseFault& fault) {
    char room[kMessageSize];
    const std::array<Insert, 4> inserts = {setting, path, fault.reason, fault.line};
    const std::size_t length =
        composeInto(room, sizeof room, fault.line == 0 ? "%s: %s: %s" : "%s: %s: %s (line %u)", inserts);
    report(kCodeError, function, fault.line == 0 ? 10 : 20, status, {room, std::min(length, sizeof room)});
}

Status URE::registerObserver(IObserver& observer, Takes takes) {
    return guarded([&] {
        observers_.push_back({&observer, takes});
        return kSuccess;
    });
}

void URE::unregisterObserver(IObserver& observer) {
    std::erase_if(observers_, [&](const Registered& each) { return each.observer == &observer; });
}

void URE::handOut(UREBaseInfo& info, bool isTrace) {
    // By index: an observer may register or unregister observers meanwhile.
    for (std::size_t i = 0; i < observers_.size(); ++i) {
        const Registered each = observers_[i];
        if (each.isCalled || (isTrace && each.takes != Takes::everything)) {
            continue;
        }
        observers_[i].isCalled = true;
        guarded([&] { return each.observer->update(info); });
        if (i < observers_.size() && observers_[i].observer == each.observer) {
            observers_[i].isCalled = false;
        }
    }
}

void URE::raiseProgress(UREProgressInfo info) {
    if (progressObserver_ != nullptr) {
        guarded([&] {
            progressObserver_->progress(kCustomActionName, info);
            return kSuccess;
        });
    }
    handOut(info, false);
}

void URE::startTask(std::uint64_t startValue, std::int32_t task, bool installation, std::string_view description) {
    raiseProgress({ProgressKind::start, startValue, task, installation, description});
}

void URE::endTask(std::int32_t task, bool installation, std::string_view description) {
    raiseProgress({ProgressKind::end, 0, task, installation, description});
}

void URE::announceTasks(std::string_view taskList) {
    const Insert insert = taskList;
    message(kCodeTaskList, kTaskListMessage, {&insert, 1});
}

void URE::message(std::uint32_t code, std::uint32_t textNumber, std::span<const Insert> inserts) {
    UREInfo info(messages, code, textNumber, inserts);
    handOut(info, false);
}

void URE::traceMessage(std::uint32_t textNumber, std::span<const Insert> inserts) {
    UREInfo info(messages, kTraceError, textNumber, inserts);
    handOut(info, true);
}

UREInfo::Response URE::ask(std::uint32_t number, std::uint32_t textNumber, std::span<const Insert> inserts,
                           std::string_view defaultValue, std::string& answer) {
    UREInfo info(messages, kClassQuestion << 16 | number, textNumber, inserts);
    info.ask(defaultValue);
    handOut(info, false);
    const Status kept = guarded([&] {
        if (info.response() == UREInfo::Response::answered) {
            answer = info.answer();
        }
        return kSuccess;
    });
    return kept == kSuccess ? info.response() : UREInfo::Response::none;
}

void URE::raiseReport(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value,
                      std::string_view text, bool isTrace) {
    if (text.empty() && value >= kFirstOwnStatus && value <= kLastOwnStatus) {
        text = messages.plainText(value);
    }
    const std::array<Insert, 4> with = {function, probe, value, text};
    const std::array<Insert, 3> without = {function, probe, text};
    const std::uint32_t number = value != kSuccess ? (text.empty() ? kReportValueMessage : kReportBothMessage)
                                                   : (text.empty() ? kReportMessage : kReportTextMessage);
    UREInfo info(messages, code, number,
                 value != kSuccess ? std::span<const Insert>(with) : std::span<const Insert>(without));
    handOut(info, isTrace);
}

void URE::report(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value,
                 std::string_view text) {
    raiseReport(code, function, probe, value, text, false);
}

void URE::trace(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value,
                std::string_view text) {
    raiseReport(code, function, probe, value, text, true);
}

void URE::error(std::uint32_t code, std::string_view function, std::uint32_t probe, Status value) {
    raiseReport(code, function, probe, value, {}, false);
}

void URE::post(std::uint32_t number, std::uint32_t flags, std::string_view source, std::string_view insert) {
    const std::array<Insert, 2> inserts = {source, insert};
    message(flags, number, inserts);
}

}  // namespace kz7
