#include "install/platform/windows/installer_session.h"

#include <windows.h>
// The types above first.
#include <msi.h>
#include <msiquery.h>

#include <string>

namespace kz7 {
namespace {

MSIHANDLE native(SessionHandle handle) {
    return static_cast<MSIHANDLE>(handle);
}

// A handle that the installer gave, or what it means that it gave none.
Status giveHandle(MSIHANDLE given, Status none, SessionHandle& handle) {
    if (given == 0) {
        return none;
    }
    handle = SessionHandle{given};
    return kSuccess;
}

}  // namespace

Status WindowsInstallerSession::runMode(RunMode mode, bool& isOn) {
    isOn = MsiGetMode(installation_, static_cast<MSIRUNMODE>(mode)) != FALSE;
    return kSuccess;
}

Status WindowsInstallerSession::getProperty(std::string_view name, Buffer& value) {
    DWORD length = value.capacity;
    const UINT status = MsiGetPropertyA(installation_, std::string(name).c_str(), value.data, &length);
    if (status == ERROR_SUCCESS || status == ERROR_MORE_DATA) {
        value.size = length;
    }
    return status;
}

Status WindowsInstallerSession::setProperty(std::string_view name, std::string_view value) {
    return MsiSetPropertyA(installation_, std::string(name).c_str(), std::string(value).c_str());
}

Status WindowsInstallerSession::featureState(std::string_view feature, FeatureState& installed,
                                             FeatureState& requested) {
    INSTALLSTATE is = INSTALLSTATE_UNKNOWN;
    INSTALLSTATE toBe = INSTALLSTATE_UNKNOWN;
    const UINT status = MsiGetFeatureStateA(installation_, std::string(feature).c_str(), &is, &toBe);
    if (status == ERROR_SUCCESS) {
        installed = static_cast<FeatureState>(is);
        requested = static_cast<FeatureState>(toBe);
    }
    return status;
}

Status WindowsInstallerSession::doAction(std::string_view name) {
    return MsiDoActionA(installation_, std::string(name).c_str());
}

Status WindowsInstallerSession::activeDatabase(SessionHandle& database) {
    return giveHandle(MsiGetActiveDatabase(installation_), kInvalidHandle, database);
}

Status WindowsInstallerSession::openView(SessionHandle database, std::string_view query, SessionHandle& view) {
    MSIHANDLE opened = 0;
    const UINT status = MsiDatabaseOpenViewA(native(database), std::string(query).c_str(), &opened);
    return status != ERROR_SUCCESS ? status : giveHandle(opened, kInvalidHandle, view);
}

Status WindowsInstallerSession::executeView(SessionHandle view) {
    return MsiViewExecute(native(view), 0);
}

Status WindowsInstallerSession::fetchRecord(SessionHandle view, SessionHandle& record) {
    MSIHANDLE fetched = 0;
    const UINT status = MsiViewFetch(native(view), &fetched);
    return status != ERROR_SUCCESS ? status : giveHandle(fetched, kInvalidHandle, record);
}

Status WindowsInstallerSession::recordString(SessionHandle record, std::uint32_t field, Buffer& text) {
    DWORD length = text.capacity;
    // Without a buffer the installer takes any room to be enough.
    char none = '\0';
    const UINT status = MsiRecordGetStringA(native(record), field, text.data != nullptr ? text.data : &none, &length);
    if (status == ERROR_SUCCESS || status == ERROR_MORE_DATA) {
        text.size = length;
    }
    return status;
}

Status WindowsInstallerSession::createRecord(std::uint32_t fields, SessionHandle& record) {
    return giveHandle(MsiCreateRecord(fields), kOutOfMemory, record);
}

Status WindowsInstallerSession::setRecordString(SessionHandle record, std::uint32_t field, std::string_view text) {
    return MsiRecordSetStringA(native(record), field, std::string(text).c_str());
}

Status WindowsInstallerSession::processMessage(std::uint32_t kind, SessionHandle record, std::int32_t& answer) {
    const int chosen = MsiProcessMessage(installation_, static_cast<INSTALLMESSAGE>(kind), native(record));
    if (chosen == -1) {
        return kInvalidHandle;
    }
    answer = chosen;
    return kSuccess;
}

Status WindowsInstallerSession::closeHandle(SessionHandle handle) {
    return MsiCloseHandle(native(handle));
}

std::unique_ptr<IInstallerSession> hostInstallerSession(std::uint32_t installation) {
    return std::make_unique<WindowsInstallerSession>(installation);
}

}  // namespace kz7
