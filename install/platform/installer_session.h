// The installer-session port: the running installation that a custom action belongs to, one operation per call of the
// installer's interface. It comes with the handle of a custom action, not with the machine.
#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <string_view>

#include "install/platform/buffer.h"
#include "install/platform/owned_handle.h"
#include "install/platform/status.h"

namespace kz7 {

// A record, a view or the database of the session.
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

inline constexpr std::int32_t kBoxAnswerOk = 1;  // results of processMessage()
inline constexpr std::int32_t kBoxAnswerCancel = 2;

// How a custom action runs; the numbers are the installer's. Any other action is immediate.
enum class RunMode : std::uint32_t { scheduled = 16, rollback = 17 };

// How a feature is, or is to be, installed; the numbers are the installer's.
enum class FeatureState : std::int32_t { unknown = -1, advertised = 1, absent = 2, local = 3, source = 4 };

// Outputs are written on success only, but for Buffer::size. kInvalidHandle: not an open handle. One thread.
//
// A scheduled or rollback action can read the properties in kReadableWhenScheduled and write messages. Every other
// property is empty to it, and every other operation fails.
inline constexpr std::array<std::string_view, 3> kReadableWhenScheduled = {"CustomActionData", "UserSID",
                                                                           "ProductCode"};

class IInstallerSession {
public:
    virtual ~IInstallerSession() = default;

    virtual Status runMode(RunMode mode, bool& isOn) = 0;

    // An unknown property is empty. The size excludes the NUL, which must fit too. kMoreData: the size is then a
    // hint, which may be larger than the value.
    virtual Status getProperty(std::string_view name, Buffer& value) = 0;

    // An empty value unsets it.
    virtual Status setProperty(std::string_view name, std::string_view value) = 0;

    // kUnknownFeature: the installation has no feature of that name.
    virtual Status featureState(std::string_view feature, FeatureState& installed, FeatureState& requested) = 0;

    // Runs an action of the installation by name.
    virtual Status doAction(std::string_view name) = 0;

    // Opens the database of the installation. kInvalidHandle: none exists. The caller closes it.
    virtual Status activeDatabase(SessionHandle& database) = 0;

    // Opens a view of the rows that a query selects once it is executed. The caller closes it.
    virtual Status openView(SessionHandle database, std::string_view query, SessionHandle& view) = 0;
    virtual Status executeView(SessionHandle view) = 0;

    // Fetches the next row. kNoMoreItems after the last. The caller closes it.
    virtual Status fetchRecord(SessionHandle view, SessionHandle& record) = 0;

    // Reads a field, counted from 1. The size excludes the NUL, which must fit too; after kMoreData it is that of the
    // whole field.
    virtual Status recordString(SessionHandle record, std::uint32_t field, Buffer& text) = 0;

    // Creates a record with that many fields, counted from 1; field 0 is its template. The caller closes it.
    virtual Status createRecord(std::uint32_t fields, SessionHandle& record) = 0;

    // The installer expands "[Name]" in every field; see escapedForSession().
    virtual Status setRecordString(SessionHandle record, std::uint32_t field, std::string_view text) = 0;

    // Processes a record as a message of that kind. `answer` is the chosen button, 0 if none was.
    virtual Status processMessage(std::uint32_t kind, SessionHandle record, std::int32_t& answer) = 0;

    virtual Status closeHandle(SessionHandle handle) = 0;
};

// The session of the handle that a custom action was called with; the installer keeps owning it. Windows only.
std::unique_ptr<IInstallerSession> hostInstallerSession(std::uint32_t installation);

using OwnedSessionHandle = OwnedHandle<PortTraits<IInstallerSession, SessionHandle, &IInstallerSession::closeHandle>>;

}  // namespace kz7
