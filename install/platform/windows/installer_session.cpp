#include "install/platform/installer_session.h"

#include <windows.h>
// Needs the types above.
#include <msi.h>
#include <msiquery.h>

#include <algorithm>
#include <string>

#include "install/platform/registry_path.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

constexpr std::size_t kFirstRoom = 1024;

MSIHANDLE native(SessionHandle handle) {
    return static_cast<MSIHANDLE>(handle);
}

// A handle that the installer returned, or the status for none.
Status giveHandle(MSIHANDLE given, Status none, SessionHandle& handle) {
    if (given == 0) {
        return none;
    }
    handle = SessionHandle{given};
    return kSuccess;
}

// The text of a call that fills a buffer or returns the size needed, in characters. That size may be twice the real
// one.
template <typename Call>
Status readText(Buffer& text, Call call) {
    std::wstring room(kFirstRoom, L'\0');
    for (;;) {
        auto size = static_cast<DWORD>(room.size());
        const UINT status = call(room.data(), &size);
        if (status == ERROR_SUCCESS) {
            return giveName(textFromWide(std::wstring_view(room).substr(0, size)), text);
        }
        if (status != ERROR_MORE_DATA) {
            return status;
        }
        room.resize(std::max<std::size_t>(2 * room.size(), std::size_t{size} + 1));
    }
}

class WindowsInstallerSession final : public IInstallerSession {
public:
    // The installer owns the handle.
    explicit WindowsInstallerSession(std::uint32_t installation) : installation_(installation) {}

    Status runMode(RunMode mode, bool& isOn) override {
        isOn = MsiGetMode(installation_, static_cast<MSIRUNMODE>(mode)) != FALSE;
        return kSuccess;
    }

    Status getProperty(std::string_view name, Buffer& value) override {
        const WideText wide(name);
        return readText(value, [&](wchar_t* room, DWORD* size) {
            return MsiGetPropertyW(installation_, wide.c_str(), room, size);
        });
    }

    Status setProperty(std::string_view name, std::string_view value) override {
        return MsiSetPropertyW(installation_, WideText(name).c_str(), WideText(value).c_str());
    }

    Status featureState(std::string_view feature, FeatureState& installed, FeatureState& requested) override {
        INSTALLSTATE is = INSTALLSTATE_UNKNOWN;
        INSTALLSTATE toBe = INSTALLSTATE_UNKNOWN;
        const UINT status = MsiGetFeatureStateW(installation_, WideText(feature).c_str(), &is, &toBe);
        if (status == ERROR_SUCCESS) {
            installed = static_cast<FeatureState>(is);
            requested = static_cast<FeatureState>(toBe);
        }
        return status;
    }

    Status doAction(std::string_view name) override { return MsiDoActionW(installation_, WideText(name).c_str()); }

    Status activeDatabase(SessionHandle& database) override {
        return giveHandle(MsiGetActiveDatabase(installation_), kInvalidHandle, database);
    }

    Status openView(SessionHandle database, std::string_view query, SessionHandle& view) override {
        MSIHANDLE opened = 0;
        const UINT status = MsiDatabaseOpenViewW(native(database), WideText(query).c_str(), &opened);
        return status != ERROR_SUCCESS ? status : giveHandle(opened, kInvalidHandle, view);
    }

    Status executeView(SessionHandle view) override { return MsiViewExecute(native(view), 0); }

    Status fetchRecord(SessionHandle view, SessionHandle& record) override {
        MSIHANDLE fetched = 0;
        const UINT status = MsiViewFetch(native(view), &fetched);
        return status != ERROR_SUCCESS ? status : giveHandle(fetched, kInvalidHandle, record);
    }

    Status recordString(SessionHandle record, std::uint32_t field, Buffer& text) override {
        return readText(
            text, [&](wchar_t* room, DWORD* size) { return MsiRecordGetStringW(native(record), field, room, size); });
    }

    Status createRecord(std::uint32_t fields, SessionHandle& record) override {
        return giveHandle(MsiCreateRecord(fields), kOutOfMemory, record);
    }

    Status setRecordString(SessionHandle record, std::uint32_t field, std::string_view text) override {
        return MsiRecordSetStringW(native(record), field, WideText(text).c_str());
    }

    Status processMessage(std::uint32_t kind, SessionHandle record, std::int32_t& answer) override {
        const int chosen = MsiProcessMessage(installation_, static_cast<INSTALLMESSAGE>(kind), native(record));
        if (chosen == -1) {
            return kInvalidHandle;
        }
        answer = chosen;
        return kSuccess;
    }

    Status closeHandle(SessionHandle handle) override { return MsiCloseHandle(native(handle)); }

private:
    std::uint32_t installation_;
};

}  // namespace

std::unique_ptr<IInstallerSession> hostInstallerSession(std::uint32_t installation) {
    return std::make_unique<WindowsInstallerSession>(installation);
}

}  // namespace kz7
