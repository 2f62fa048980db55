// The custom actions of the sample product. The deferred one loads kz7actions64.dll from the path in its data, which
// only the installer can set, and reads a property that the immediate phase saved.
#include <windows.h>
// Needs the types above.
#include <msi.h>
#include <msiquery.h>

#include <cstdint>
#include <string>

#include "kz7/actions/kz7actions.h"

namespace {

void log(MSIHANDLE installation, const std::string& text) {
    const MSIHANDLE record = MsiCreateRecord(1);
    MsiRecordSetStringA(record, 0, "[1]");
    MsiRecordSetStringA(record, 1, text.c_str());
    MsiProcessMessage(installation, INSTALLMESSAGE_INFO, record);
    MsiCloseHandle(record);
}

// The data of the action that runs; empty if it does not fit.
std::string actionData(MSIHANDLE installation) {
    char data[MAX_PATH];
    DWORD length = sizeof data;
    return MsiGetPropertyA(installation, "CustomActionData", data, &length) == ERROR_SUCCESS ? data : std::string{};
}

// The copy's name, as the immediate phase saved it; empty if it cannot be read.
std::string savedCopyName(MSIHANDLE installation, const std::string& libraryPath) {
    const HMODULE library = LoadLibraryExA(libraryPath.c_str(), nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
    if (library == nullptr) {
        return {};
    }
    // Cast through a function type: any other conversion of FARPROC is a warning.
    const auto read = reinterpret_cast<decltype(&iMsiGetProperty)>(
        reinterpret_cast<void (*)()>(GetProcAddress(library, "iMsiGetProperty")));
    char name[1024];  // enough for every saved value
    std::uint32_t size = sizeof name;
    const bool isRead = read != nullptr && read(installation, "KZ7_COPY_NAME", name, &size) == ERROR_SUCCESS;
    FreeLibrary(library);
    return isRead ? name : std::string{};
}

}  // namespace

extern "C" {

__declspec(dllexport) UINT registerCopy(MSIHANDLE installation) {
    const std::string name = savedCopyName(installation, actionData(installation));
    log(installation, "sample: register " + name);
    return name.empty() ? ERROR_INSTALL_FAILURE : ERROR_SUCCESS;
}

__declspec(dllexport) UINT unregisterCopy(MSIHANDLE installation) {
    log(installation, "sample: take back " + actionData(installation));
    return ERROR_SUCCESS;
}

__declspec(dllexport) UINT failOnPurpose(MSIHANDLE) {
    return ERROR_INSTALL_FAILURE;
}

}  // extern "C"
