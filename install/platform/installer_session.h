// The installer-session port: the running installation that a custom action belongs to, one operation for each
// call of the installer's interface that is made. It comes with a custom action's handle, not with the machine.
#pragma once

#include <cstdint>
#include <string_view>

#include "install/platform/buffer.h"
#include "install/platform/owned_handle.h"
#include "install/platform/status.h"

namespace kz7 {

// A record of the session; whatever else of it is opened is closed alike.
enum class SessionHandle : std::uint64_t { none = 0 };

// The kind of a message; the numbers are the installer's. Errors and user messages may carry the bits of a
// message box below.
// clang-format off
inline constexpr std::uint32_t kSessionError       = 0x01000000;
inline constexpr std::uint32_t kSessionUser        = 0x03000000;
inline constexpr std::uint32_t kSessionInfo        = 0x04000000;
inline constexpr std::uint32_t kSessionActionStart = 0x08000000;
inline constexpr std::uint32_t kSessionActionData  = 0x09000000;

inline constexpr std::uint32_t kBoxOkCancel        = 0x000001;
inline constexpr std::uint32_t kBoxErrorIcon       = 0x000010;
inline constexpr std::uint32_t kBoxQuestionIcon    = 0x000020;
inline constexpr std::uint32_t kBoxRightAligned    = 0x080000;
inline constexpr std::uint32_t kBoxRightToLeft     = 0x100000;
// clang-format on

inline constexpr std::int32_t kBoxAnswerOk = 1;  // what processMessage() answers for a button
inline constexpr std::int32_t kBoxAnswerCancel = 2;

// Outputs are written on success only, but for Buffer::size. kInvalidHandle: not an open handle. One thread.
class IInstallerSession {
public:
    virtual ~IInstallerSession() = default;

    // An unknown property is empty. kMoreData: `value` is too small; its size then is a hint, which may be
    // larger than what is needed.
    virtual Status getProperty(std::string_view name, Buffer& value) = 0;

    // A record with that many fields, counted from 1; field 0 is its template. The caller closes it.
    virtual Status createRecord(std::uint32_t fields, SessionHandle& record) = 0;

    // The installer expands "[Name]" in every field; see escapedForSession().
    virtual Status setRecordString(SessionHandle record, std::uint32_t field, std::string_view text) = 0;

    // Processes a record as a message of a kind. `answer` is the button that was chosen, 0 where none was.
    virtual Status processMessage(std::uint32_t kind, SessionHandle record, std::int32_t& answer) = 0;

    virtual Status closeHandle(SessionHandle handle) = 0;
};

struct SessionTraits {
    using Port = IInstallerSession;
    using Handle = SessionHandle;
    static constexpr Handle kNone = SessionHandle::none;
    static void close(Port& port, Handle handle) { port.closeHandle(handle); }
};
using OwnedSessionHandle = OwnedHandle<SessionTraits>;

}  // namespace kz7
