// The custom-action library of a foreign package. It loads kz7actions64.dll from the path in its data, calls it by its
// C names and writes the results to the installer's log, in lines that begin with "probe".
#include <windows.h>
// Needs the types above.
#include <msi.h>
#include <msiquery.h>

#include <cstdint>
#include <sstream>
#include <string>
#include <vector>

#include "install/actions/kz7actions.h"

namespace {

constexpr DWORD kRoom = 4096;  // enough for every value of the test

std::string sessionProperty(MSIHANDLE installation, const char* name) {
    std::string value(kRoom, '\0');
    DWORD size = kRoom;
    value.resize(MsiGetPropertyA(installation, name, value.data(), &size) == ERROR_SUCCESS ? size : 0);
    return value;
}

void log(MSIHANDLE installation, const std::string& text) {
    const char* mode = MsiGetMode(installation, MSIRUNMODE_ROLLBACK)    ? "rollback"
                       : MsiGetMode(installation, MSIRUNMODE_COMMIT)    ? "commit"
                       : MsiGetMode(installation, MSIRUNMODE_SCHEDULED) ? "deferred"
                                                                        : "immediate";
    const MSIHANDLE record = MsiCreateRecord(1);
    MsiRecordSetStringA(record, 1, (std::string("probe ") + mode + ": " + text).c_str());
    MsiProcessMessage(installation, INSTALLMESSAGE_INFO, record);
    MsiCloseHandle(record);
}

// The data of an action: the path of the library, then names of properties, separated by semicolons. An immediate
// action has no data of its own.
std::vector<std::string> actionData(MSIHANDLE installation) {
    const std::string own = sessionProperty(installation, "CustomActionData");
    std::istringstream data(own.empty() ? sessionProperty(installation, "PROBE_DATA") : own);
    std::vector<std::string> fields;
    for (std::string field; std::getline(data, field, ';');) {
        fields.push_back(field);
    }
    return fields;
}

template <typename Function>
Function entryPoint(MSIHANDLE installation, const char* name) {
    // Cast by way of a function type: FARPROC converts to no other one without a warning.
    const HMODULE library = LoadLibraryA(actionData(installation).front().c_str());
    return reinterpret_cast<Function>(reinterpret_cast<void (*)()>(GetProcAddress(library, name)));
}

// One line: "NAME 3 'abc', ...", the size as the call returns it; a call that fails shows its status.
void readProperties(MSIHANDLE installation) {
    const auto read = entryPoint<decltype(&iMsiGetProperty)>(installation, "iMsiGetProperty");
    const std::vector<std::string> data = actionData(installation);
    std::string line;
    for (auto name = data.begin() + 1; name != data.end(); ++name) {
        std::string value(kRoom, '#');
        std::uint32_t size = kRoom;
        const std::uint32_t status = read(installation, name->c_str(), value.data(), &size);
        line += (line.empty() ? "" : ", ") + *name + " " + std::to_string(size) + " '" + value.c_str() + "'";
        line += status == 0 ? "" : " status " + std::to_string(status);
    }
    log(installation, line);
}

}  // namespace

extern "C" {

__declspec(dllexport) UINT probeRead(MSIHANDLE installation) {
    const std::string path = sessionProperty(installation, "UserSID") + "\\SOFTWARE\\NVQ\\KZ7\\TEMP\\PROPERTIES95";
    HKEY key = nullptr;
    const LSTATUS status = RegOpenKeyExA(HKEY_USERS, path.c_str(), 0, KEY_READ, &key);
    RegCloseKey(key);
    log(installation, "opening the key: status " + std::to_string(status));
    readProperties(installation);
    return ERROR_SUCCESS;
}

__declspec(dllexport) UINT probeChange(MSIHANDLE installation) {
    const auto substitute = entryPoint<decltype(&iSubstituteCopyName)>(installation, "iSubstituteCopyName");
    const auto set = entryPoint<decltype(&iMsiSetProperty)>(installation, "iMsiSetProperty");
    const char path[] = "InstalledCopies\\$CurrentInstallationName$";
    char output[sizeof path];
    log(installation, std::string("substituted: ") + substitute(path, "COPY1", sizeof output, output));
    log(installation, std::string("substituted without a buffer: ") + substitute(path, "COPY2", 0, nullptr));
    readProperties(installation);
    const std::vector<std::string> data = actionData(installation);
    std::string line = "setting:";
    for (auto name = data.begin() + 1; name != data.end(); ++name) {
        line += " " + std::to_string(set(installation, name->c_str(), "new"));
    }
    log(installation, line);
    readProperties(installation);
    return ERROR_SUCCESS;
}

__declspec(dllexport) UINT probeFail(MSIHANDLE) {
    return ERROR_INSTALL_FAILURE;
}

}  // extern "C"
