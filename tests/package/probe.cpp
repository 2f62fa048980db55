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
    // Cast through a function type: any other conversion of FARPROC is a warning.
    const HMODULE library = LoadLibraryA(actionData(installation).front().c_str());
    return reinterpret_cast<Function>(reinterpret_cast<void (*)()>(GetProcAddress(library, name)));
}

// One line: "NAME 3 'abc', ...", the size as the call returns it; a call that fails shows its status.
void readInto(MSIHANDLE installation, const std::vector<std::string>& names, std::uint32_t room, std::string& line) {
    const auto read = entryPoint<decltype(&iMsiGetProperty)>(installation, "iMsiGetProperty");
    for (const std::string& name : names) {
        std::string value(kRoom, '#');
        std::uint32_t size = room;
        const std::uint32_t status = read(installation, name.c_str(), value.data(), &size);
        line += (line.empty() ? "" : ", ") + name + " " + std::to_string(size);
        // NOLINTNEXTLINE(readability-redundant-string-cstr): the value ends at its NUL.
        line += status == 0 ? std::string(" '") + value.c_str() + "'" : " status " + std::to_string(status);
    }
}

void readProperties(MSIHANDLE installation) {
    const std::vector<std::string> data = actionData(installation);
    std::string line;
    readInto(installation, {data.begin() + 1, data.end()}, kRoom, line);
    log(installation, line);
}

// The results of the calls with each combination of arguments that are null; the last of each is a call with all.
void callWithNulls(MSIHANDLE installation) {
    const auto get = entryPoint<decltype(&iMsiGetProperty)>(installation, "iMsiGetProperty");
    const auto set = entryPoint<decltype(&iMsiSetProperty)>(installation, "iMsiSetProperty");
    const auto substitute = entryPoint<decltype(&iSubstituteCopyName)>(installation, "iSubstituteCopyName");
    const char* const name = "$CurrentInstallationName$";
    std::string room(kRoom, '\0');
    std::string line = "nulls:";
    for (unsigned given = 0; given < 8; ++given) {
        const auto argument = [given](unsigned bit, auto* value) { return (given & bit) != 0 ? value : nullptr; };
        std::uint32_t size = kRoom;
        line +=
            ' ' + std::to_string(get(installation, argument(1, name), argument(2, room.data()), argument(4, &size)));
        for (const std::uint32_t outputSize : {std::uint32_t{0}, std::uint32_t{kRoom}}) {
            const char* text = substitute(argument(1, name), argument(2, "COPY"), outputSize, argument(4, room.data()));
            line += text == nullptr ? " null" : std::string(" ") + text;
        }
        line += ' ' + std::to_string(set(installation, argument(1, name), argument(2, "")));
    }
    log(installation, line);
}

// The copy's name, with room for all of it but the terminator in the test of two-byte characters, and with room for it.
void readName(MSIHANDLE installation) {
    std::string line;
    for (const std::uint32_t room : {10U, 11U}) {
        readInto(installation, {"KZ7_COPY_NAME"}, room, line);
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
    readName(installation);
    callWithNulls(installation);
    return ERROR_SUCCESS;
}

__declspec(dllexport) UINT probeChange(MSIHANDLE installation) {
    const auto substitute = entryPoint<decltype(&iSubstituteCopyName)>(installation, "iSubstituteCopyName");
    const auto set = entryPoint<decltype(&iMsiSetProperty)>(installation, "iMsiSetProperty");
    const std::string copy = sessionProperty(installation, "KZ7_COPY_NAME");
    const char token[] = "$CurrentInstallationName$";
    char output[sizeof token];
    log(installation,
        std::string("substituted: ") + substitute(token, (copy + copy + copy).c_str(), sizeof output, output));
    log(installation, std::string("substituted without a buffer: ") + substitute(token, copy.c_str(), 0, nullptr));
    readName(installation);
    readProperties(installation);
    const std::vector<std::string> data = actionData(installation);
    std::string line = "setting:";
    for (auto name = data.begin() + 1; name != data.end(); ++name) {
        line += " " + std::to_string(set(installation, name->c_str(), "new"));
    }
    log(installation, line);
    readProperties(installation);
    callWithNulls(installation);
    return ERROR_SUCCESS;
}

__declspec(dllexport) UINT probeFail(MSIHANDLE) {
    return ERROR_INSTALL_FAILURE;
}

}  // extern "C"
