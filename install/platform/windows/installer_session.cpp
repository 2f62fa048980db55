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

}  // namespace

Status WindowsInstallerSession::getProperty(std::string_view name, Buffer& value) {
    DWORD length = value.capacity;
    const UINT status = MsiGetPropertyA(installation_, std::string(name).c_str(), value.data, &length);
    if (status == ERROR_SUCCESS) {
        value.size = length;
    } else if (status == ERROR_MORE_DATA) {
        value.size = length + 1;
    }
    return status;
}

Status WindowsInstallerSession::createRecord(std::uint32_t fields, SessionHandle& record) {
    const MSIHANDLE created = MsiCreateRecord(fields);
    if (created == 0) {
        return kOutOfMemory;
    }
    record = SessionHandle{created};
    return kSuccess;
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

}  // namespace kz7
