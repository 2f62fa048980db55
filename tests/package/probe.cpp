// The custom-action library of somebody else's package: it loads kz7actions64.dll from the path that it is told, calls
// it by its C names and writes what it saw to the installer's log, in lines that begin with "probe".
#include <windows.h>
// The types above first.
#include <msi.h>
#include <msiquery.h>

#include <cstdarg>
#include <cstdio>
#include <sstream>
#include <string>
#include <vector>

#include "install/actions/kz7actions.h"

namespace {

constexpr char kSavedProperties[] = "\\SOFTWARE\\NVQ\\KZ7\\TEMP\\PROPERTIES95";
constexpr DWORD kRoom = 4096;  // for whatever the tests set

std::string ownProperty(MSIHANDLE installation, const char* name) {
    std::string value(kRoom, '\0');
    DWORD size = kRoom;
    value.resize(MsiGetPropertyA(installation, name, value.data(), &size) == ERROR_SUCCESS ? size : 0);
    return value;
}

template <typename Function>
void resolve(HMODULE library, const char* name, Function& function) {
    // By way of a function without arguments: an address has no type of its own.
    function = reinterpret_cast<Function>(reinterpret_cast<void (*)()>(GetProcAddress(library, name)));
}

class Probe {
public:
    // The action is told the path of the library and names of properties, between semicolons. One that is run at once
    // has no data of its own.
    explicit Probe(MSIHANDLE installation) : installation_(installation) {
        const std::string given = ownProperty(installation, "CustomActionData");
        std::istringstream told(given.empty() ? ownProperty(installation, "PROBE_DATA") : given);
        std::string path;
        std::getline(told, path, ';');
        for (std::string name; std::getline(told, name, ';');) {
            names_.push_back(name);
        }
        const HMODULE library = LoadLibraryA(path.c_str());
        resolve(library, "iMsiGetProperty", getProperty_);
        resolve(library, "iMsiSetProperty", setProperty_);
        resolve(library, "iSubstituteCopyName", substitute_);
    }

    void tellKey() const {
        const std::string path = ownProperty(installation_, "UserSID") + kSavedProperties;
        HKEY key = nullptr;
        const LSTATUS status = RegOpenKeyExA(HKEY_USERS, path.c_str(), 0, KEY_READ, &key);
        RegCloseKey(key);
        tell("opening the key: status %ld", status);
    }

    void tellProperties() const {
        for (const std::string& name : names_) {
            std::string value(kRoom, '#');
            std::uint32_t size = kRoom;
            const std::uint32_t status = getProperty_(installation_, name.c_str(), value.data(), &size);
            tell("%s: status %u, size %u, '%s'", name.c_str(), status, size, value.c_str());
        }
    }

    // Whoever reads the old values later has them from where they were saved.
    void changeProperties() const {
        for (const std::string& name : names_) {
            tell("setting %s: status %u", name.c_str(), setProperty_(installation_, name.c_str(), "new"));
        }
    }

    void tellSubstitution() const {
        const char path[] = "InstalledCopies\\$CurrentInstallationName$";
        char output[sizeof path];
        tell("substituted: %s", substitute_(path, "COPY1", sizeof output, output));
        tell("substituted without a buffer: %s", substitute_(path, "COPY2", 0, nullptr));
    }

private:
    const char* mode() const {
        if (MsiGetMode(installation_, MSIRUNMODE_ROLLBACK)) {
            return "rollback";
        }
        if (MsiGetMode(installation_, MSIRUNMODE_COMMIT)) {
            return "commit";
        }
        return MsiGetMode(installation_, MSIRUNMODE_SCHEDULED) ? "deferred" : "immediate";
    }

    __attribute__((format(gnu_printf, 2, 3))) void tell(const char* pattern, ...) const {
        std::string text(kRoom, '\0');
        std::va_list inserts;
        va_start(inserts, pattern);
        std::vsnprintf(text.data(), text.size(), pattern, inserts);
        va_end(inserts);
        const MSIHANDLE record = MsiCreateRecord(1);
        MsiRecordSetStringA(record, 1, (std::string("probe ") + mode() + ": " + text.c_str()).c_str());
        MsiProcessMessage(installation_, INSTALLMESSAGE_INFO, record);
        MsiCloseHandle(record);
    }

    MSIHANDLE installation_;
    std::vector<std::string> names_;
    decltype(&iMsiGetProperty) getProperty_ = nullptr;
    decltype(&iMsiSetProperty) setProperty_ = nullptr;
    decltype(&iSubstituteCopyName) substitute_ = nullptr;
};

}  // namespace

extern "C" {

__declspec(dllexport) UINT probeRead(MSIHANDLE installation) {
    const Probe probe(installation);
    probe.tellKey();
    probe.tellProperties();
    return ERROR_SUCCESS;
}

__declspec(dllexport) UINT probeChange(MSIHANDLE installation) {
    const Probe probe(installation);
    probe.tellSubstitution();
    probe.tellProperties();
    probe.changeProperties();
    probe.tellProperties();
    return ERROR_SUCCESS;
}

__declspec(dllexport) UINT probeFail(MSIHANDLE) {
    return ERROR_INSTALL_FAILURE;
}

}  // extern "C"
