// Infos that the installer runtime hands to its observers: tasks that start or end, and messages, including questions.
#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string_view>

#include "install/platform/status.h"
#include "install/platform/text.h"

namespace kz7 {

class MessageCatalogue;

inline constexpr std::size_t kMessageSize = 1024;  // characters of a copied text with its terminator

// clang-format off
inline constexpr std::uint32_t kClassInformation = 0x0100;  // the high 16 bits of a message code
inline constexpr std::uint32_t kClassError       = 0x0400;
inline constexpr std::uint32_t kClassOtherError  = 0x2400;
inline constexpr std::uint32_t kClassQuestion    = 0x4400;

inline constexpr std::uint32_t kCodeReport       = 0x4000000;  // whole codes
inline constexpr std::uint32_t kCodeWarning      = 0x4000002;
inline constexpr std::uint32_t kCodeError        = 0x4000100;
inline constexpr std::uint32_t kCodeTaskList     = 0x1000004;
inline constexpr std::uint32_t kCodeMediumNeeded = 0x44000001;
// clang-format on

enum class InfoType : std::uint32_t { progress = 1, message = 2 };

class UREBaseInfo {
public:
    virtual InfoType getInfoType() const = 0;
    virtual ~UREBaseInfo() = default;

protected:
    UREBaseInfo() = default;
    UREBaseInfo(const UREBaseInfo&) = default;
    UREBaseInfo& operator=(const UREBaseInfo&) = default;
};

enum class ProgressKind : std::uint16_t { start = 0x200, end = 0x400 };

inline constexpr std::int32_t kUndoTask = 3577;  // not a task: the roll-back

// A task that starts or ends. Infos do not own their texts, which are valid until the last observer returns.
class UREProgressInfo final : public UREBaseInfo {
public:
    UREProgressInfo(ProgressKind kind, std::uint64_t startValue, std::int32_t task, bool installation,
                    std::string_view description)
        : kind_(kind), startValue_(startValue), task_(task), installation_(installation), description_(description) {}

    InfoType getInfoType() const override { return InfoType::progress; }
    ProgressKind kind() const { return kind_; }

    // All ones for anything but a start.
    std::uint64_t startValue() const { return kind_ == ProgressKind::start ? startValue_ : ~std::uint64_t{0}; }
    std::int32_t task() const { return task_; }

    // False: a configuration task.
    bool isInstallation() const { return installation_; }

    // Truncated to the size of `text`.
    void copyDescription(FixedText<kMessageSize>& text) const { text.assign(description_); }

private:
    ProgressKind kind_;
    std::uint64_t startValue_;
    std::int32_t task_;
    bool installation_;
    std::string_view description_;
};

// A message: a code, whose high 16 bits are its class and whose low 16 bits its number in that class, and a text of the
// catalogue with inserts. The text has a number of its own.
class UREInfo final : public UREBaseInfo {
public:
    static constexpr std::size_t kMaxInserts = 4;

    // Inserts beyond kMaxInserts are ignored.
    UREInfo(const MessageCatalogue& catalogue, std::uint32_t code, std::uint32_t textNumber,
            std::span<const Insert> inserts);

    InfoType getInfoType() const override { return InfoType::message; }
    std::uint32_t code() const { return code_; }
    std::uint32_t messageClass() const { return code_ >> 16; }
    std::uint32_t number() const { return code_ & 0xFFFF; }

    // Copies the text, truncated to `size` bytes and without a terminator; `length` is that of the whole text.
    // kBufferTooSmall: it was truncated. kNoInstallerSession: the catalogue has no such text.
    Status copyText(char* room, std::size_t size, std::size_t& length) const;

    // The same into a fixed text. A missing text is replaced by one that names the code.
    void copyText(FixedText<kMessageSize>& text) const;

    // Copies the text that replaces a missing one.
    void copyMissingText(FixedText<kMessageSize>& text) const;

    // The task list of a message with kCodeTaskList; empty for any other message.
    std::string_view taskList() const;

    // Makes the message a question with a proposed answer.
    void ask(std::string_view defaultValue) {
        queryFlag_ = 1;
        default_ = defaultValue;
    }
    bool isQuestion() const { return messageClass() == kClassQuestion && queryFlag_ == 1; }
    std::string_view defaultValue() const { return default_; }

    // Stores the user's answer; null: the user aborted.
    void setResponse(const char* text);

    enum class Response { none, aborted, answered };
    Response response() const { return response_; }
    std::string_view answer() const { return answer_.view(); }

private:
    std::span<const Insert> inserts() const { return {inserts_.data(), insertCount_}; }

    const MessageCatalogue& catalogue_;
    std::uint32_t code_;
    std::uint32_t textNumber_;
    std::array<Insert, kMaxInserts> inserts_{};
    std::size_t insertCount_;
    std::uint32_t queryFlag_ = 0;
    std::string_view default_;
    Response response_ = Response::none;
    FixedText<kMessageSize> answer_;
};

}  // namespace kz7
